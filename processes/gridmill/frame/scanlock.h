#pragma once

namespace orvik::frame {

/// The critical section of the focus measures, from construction to destruction. There is one for the whole
/// process: two scans never run at the same time, whatever their operators and types.
class ScanLock {
 public:
  ScanLock();
  ScanLock(const ScanLock&) = delete;
  ScanLock& operator=(const ScanLock&) = delete;
  ~ScanLock();
};

}  // namespace orvik::frame
