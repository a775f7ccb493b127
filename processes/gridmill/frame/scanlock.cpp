#include "processes/gridmill/frame/scanlock.h"

#include <mutex>

namespace orvik::frame {

namespace {

// NOLINTNEXTLINE(cppcoreguidelines-avoid-non-const-global-variables): one lock for the whole process
std::mutex scan;

}  // namespace

ScanLock::ScanLock() { scan.lock(); }
ScanLock::~ScanLock() { scan.unlock(); }

}  // namespace orvik::frame
