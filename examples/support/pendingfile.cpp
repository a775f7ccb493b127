#include "pendingfile.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstring>
#include <filesystem>

#include <fcntl.h>
#include <unistd.h>

#include "errors.h"

namespace examples {

namespace fs = std::filesystem;

namespace {

// The paths that the signal handler removes. A handler may touch neither the heap nor a lock, hence plain
// arrays.
constexpr int slots = 4;
char pending[slots][PATH_MAX];
volatile std::sig_atomic_t used[slots];

void RemovePending(int signal) {
  for (int slot = 0; slot < slots; ++slot)
    if (used[slot]) unlink(pending[slot]);
  std::signal(signal, SIG_DFL);
  std::raise(signal);
}

void WatchSignals() {
  static const bool watched = [] {
    for (const int signal : {SIGINT, SIGTERM, SIGHUP})
      if (std::signal(signal, RemovePending) == SIG_IGN) std::signal(signal, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);  // a file over the size limit becomes a write error
    return true;
  }();
  static_cast<void>(watched);
}

int Register(const std::string& path) {
  WatchSignals();
  for (int slot = 0; slot < slots; ++slot) {
    if (used[slot]) continue;
    if (path.size() >= PATH_MAX) break;
    std::memcpy(pending[slot], path.c_str(), path.size() + 1);
    used[slot] = 1;
    return slot;
  }
  throw Failure("cannot keep track of '" + path + "'");
}

fs::path FolderOf(const std::string& target) {
  const fs::path folder = fs::path(target).parent_path();
  return folder.empty() ? fs::path(".") : folder;
}

std::string Listed(const std::vector<std::string>& words) {
  std::string list;
  for (const std::string& word : words) list += (list.empty() ? "" : " or ") + word;
  return list;
}

}  // namespace

PendingFile::PendingFile(const std::string& argument, const std::string& target) : target_(target) {
  static int count = 0;
  const std::string name = ".gridmill-" + std::to_string(getpid()) + "-" + std::to_string(count++) +
                           fs::path(target).extension().string();
  temporary_ = (FolderOf(target) / name).string();
  slot_ = Register(temporary_);
  const int file = open(temporary_.c_str(), O_CREAT | O_EXCL | O_WRONLY | O_CLOEXEC, 0666);
  if (file >= 0) {
    close(file);
    return;
  }
  const std::string reason = std::strerror(errno);
  used[slot_] = 0;
  throw Refusal(argument, "cannot write to folder '" + FolderOf(target).string() + "': " + reason,
                "a folder that exists and takes new files");
}

PendingFile::~PendingFile() {
  if (!used[slot_]) return;
  std::error_code ignored;
  fs::remove(temporary_, ignored);
  fs::remove(temporary_ + ".aux.xml", ignored);
  used[slot_] = 0;
}

void PendingFile::Commit() {
  fs::rename(temporary_, target_);
  used[slot_] = 0;
  fs::remove(target_ + ".aux.xml");  // statistics and the like of the file that was replaced
  if (fs::exists(temporary_ + ".aux.xml")) fs::rename(temporary_ + ".aux.xml", target_ + ".aux.xml");
}

void CheckTarget(const std::string& argument, const std::string& target,
                 const std::vector<std::string>& sources, const std::vector<std::string>& suffixes) {
  std::string suffix = fs::path(target).extension().string();
  std::transform(suffix.begin(), suffix.end(), suffix.begin(),
                 [](unsigned char c) { return std::tolower(c); });
  if (std::find(suffixes.begin(), suffixes.end(), suffix) == suffixes.end())
    throw Refusal(argument, "'" + target + "' is no name for this format",
                  "a name that ends in " + Listed(suffixes));
  std::error_code ignored;
  for (const std::string& source : sources)
    if (fs::weakly_canonical(source, ignored) == fs::weakly_canonical(target, ignored) ||
        fs::equivalent(source, target, ignored))
      throw Refusal(argument, "'" + target + "' is also '" + source + "'", "a file of its own");
  if (fs::exists(target, ignored) && !fs::is_regular_file(target, ignored))
    throw Refusal(argument, "'" + target + "' exists and is not a plain file", "the name of a file");
}

}  // namespace examples
