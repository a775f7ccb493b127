#pragma once

#include <string>
#include <utility>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameters of `MirrorImg`. Setters store the value, with no check.
class GRIDMILL_EXPORT MirrorImgParams {
 public:
  std::string Axis;                  ///< "VERT" or "HORI", in upper or lower case
  std::vector<unsigned int> Window;  ///< empty, or four entries of which [2] is the width and [3] the height
  bool isNewFile = false;            ///< see `IsNewFile`; to be set

  void SetAxis(std::string axis) { Axis = std::move(axis); }
  void SetWindow(std::vector<unsigned int> window) { Window = std::move(window); }

  /// A setter: true for an output of the mirrored pixels alone, packed from coordinate 0 along the flip,
  /// false for a full copy in which the window is mirrored in place.
  void IsNewFile(bool value) { isNewFile = value; }
};

}  // namespace details

/// A mirrored raster, or one in which a window is mirrored.
///
/// In: any of the ten pixel types, real, any number of channels.
/// Mask: a set bit marks a pixel of the window; null marks all.
/// Out: any of the ten pixel types, the channels of the input, another raster than the input; of the input's
/// size, or with `IsNewFile` of the size that the window needs.
///
/// "VERT" reverses x within each row: the k-th marked pixel of a row, the first of them at x0, is taken from
/// (x0 + w - 1 - k, y), with the window's width w, and written to (x0 + k, y), or with `IsNewFile` to (k, y).
/// "HORI" reverses y within each column in the same way. The window's width and height are the raster's, or
/// entries 2 and 3 of `Window`; its place is where the mask's bits are. Pixels that are not marked are copied
/// to their own place, or with `IsNewFile` not written. Any other `Axis` writes nothing.
///
/// Parameters: `Axis` and `Window` empty by default, `IsNewFile` is the caller's to set. A setter called
/// after `Process` takes effect when a type changes. Failures: `Exception` "Invalid type requested." if the
/// type of the input or the output is none of the ten, a complex one included; std::bad_alloc. No pointer is
/// tested but the mask's, no sizes are compared, and a source that leaves the window is not clamped. Threads:
/// runs on the caller's thread. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: every sample goes through `float` and `ClipTo`, between equal types too. `double`, 32-bit and
/// 64-bit samples lose precision, and a negative 64-bit signed sample becomes 0.
/// Deliberate: `IsNewFile` moves pixels along the flip only. The other coordinate keeps the window's offset.
/// Deliberate: marked pixels with a gap between them are counted as if they had none.
/// Deliberate: a rebuild leaves the old processor allocated.
///
/// Example: "vert" turns the row 1 2 3 into 3 2 1.
class GRIDMILL_EXPORT MirrorImg : public details::MirrorImgParams {
 public:
  MirrorImg();
  MirrorImg(const MirrorImg&);
  MirrorImg& operator=(const MirrorImg&);
  ~MirrorImg();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
