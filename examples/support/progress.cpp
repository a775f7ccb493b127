#include "progress.h"

#include <cstdio>
#include <utility>

#include <unistd.h>

namespace examples {

Progress::Progress(std::string what, std::size_t steps)
    : what_(std::move(what)), steps_(steps), terminal_(isatty(STDERR_FILENO) == 1) {
  if (!terminal_) std::fprintf(stderr, "%s: %zu %s\n", what_.c_str(), steps_, steps_ == 1 ? "tile" : "tiles");
}

Progress::~Progress() {
  if (terminal_) std::fputs("\r\033[K", stderr);
}

void Progress::Step() {
  ++done_;
  if (!terminal_) return;
  const Clock::time_point now = Clock::now();
  if (done_ < steps_ && now - drawn_ < std::chrono::milliseconds(50)) return;
  drawn_ = now;
  Draw();
}

double Progress::Seconds() const { return std::chrono::duration<double>(Clock::now() - start_).count(); }

void Progress::Draw() {
  constexpr std::size_t width = 30;
  const std::size_t full = done_ * width / steps_;
  const std::string bar = std::string(full, '#') + std::string(width - full, '.');
  std::fprintf(stderr, "\r%s [%s] %3zu %%, tile %zu of %zu", what_.c_str(), bar.c_str(), done_ * 100 / steps_,
               done_, steps_);
  std::fflush(stderr);
}

}  // namespace examples
