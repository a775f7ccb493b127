#pragma once

#include <string>
#include <vector>

namespace examples {

/// A file that appears under its name only when it is complete.
///
/// It is written under a temporary name in the same folder and renamed by `Commit`. Without `Commit` the
/// destructor removes it, and so does the death of the program by SIGINT, SIGTERM or SIGHUP; a file that
/// stood under the name before stays as it was.
class PendingFile {
 public:
  /// Reserves the temporary name. @throws Refusal naming `argument` if the folder takes no file
  PendingFile(const std::string& argument, const std::string& target);
  PendingFile(const PendingFile&) = delete;
  PendingFile& operator=(const PendingFile&) = delete;
  ~PendingFile();

  const std::string& TemporaryPath() const { return temporary_; }
  const std::string& Target() const { return target_; }
  void Commit();

 private:
  std::string target_;
  std::string temporary_;
  int slot_;
};

/// Refuses a target that is no place for a new file: one of the `sources`, a folder, a device, a name without
/// one of the `suffixes`.
void CheckTarget(const std::string& argument, const std::string& target,
                 const std::vector<std::string>& sources, const std::vector<std::string>& suffixes);

}  // namespace examples
