#include "processes/gridmill/frame/scanlock.h"

#include <mutex>

namespace orvik::frame {

namespace {

std::mutex scan;

}  // namespace

ScanLock::ScanLock() { scan.lock(); }
ScanLock::~ScanLock() { scan.unlock(); }

}  // namespace orvik::frame
