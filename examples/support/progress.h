#pragma once

#include <chrono>
#include <cstddef>
#include <string>

namespace examples {

/// Progress on standard error: a bar on a terminal, one plain line at the start elsewhere.
class Progress {
 public:
  Progress(std::string what, std::size_t steps);
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;
  ~Progress();

  void Step();
  double Seconds() const;

 private:
  void Draw();

  using Clock = std::chrono::steady_clock;
  std::string what_;
  std::size_t steps_;
  std::size_t done_ = 0;
  bool terminal_;
  Clock::time_point start_ = Clock::now();
  Clock::time_point drawn_;
};

}  // namespace examples
