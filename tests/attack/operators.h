#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <ostream>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

// The operators as the attacks on them see them: built, called and read in one way, with types at run time.
namespace orvik::attack {

/// What a call may take. An operator takes of it what it has a parameter for.
struct Call {
  tessel::Raster* in;
  tessel::Raster* reference;
  tessel::Mask* mask;       ///< null: all pixels are valid
  tessel::Mask* excluding;  ///< the same pixels, with set bits for the excluded ones
  tessel::Raster* out;
};

/// One operator with workable parameters.
class Object {
 public:
  virtual ~Object() = default;
  virtual void Process(const Call& call) = 0;
  /// What it has collected instead of writing it, or beside it.
  virtual std::vector<double> Collected() = 0;
};

/// Which types an operator takes.
enum class Takes {
  kPair,    ///< input and output, ten types each
  kDates,   ///< the same, with a reference that is read as the input's type
  kTriple,  ///< input, reference and output, four types each
};

enum class Complex { kRefused, kRealParts, kElements };

/// What becomes of the channels of a pixel.
enum class Channels {
  kEach,      ///< each gives the same channel of the output, or an entry of what is collected
  kFirst,     ///< the first ones are read
  kPacked,    ///< as many elements of a row are read as it has pixels
  kTogether,  ///< all matter; equal ones give what `read` ones give
  kBeside,    ///< those of the input, then those of the reference
};

struct Operator {
  const char* name;
  std::unique_ptr<Object> (*make)(std::uint32_t channels);  ///< for an input of that many channels
  Takes takes = Takes::kPair;
  Complex complex = Complex::kRefused;
  Channels channels = Channels::kEach;
  std::uint32_t least = 1;     ///< channels that an input has at least
  std::uint32_t read = 1;      ///< channels that matter, see `Channels`
  std::uint32_t outFixed = 0;  ///< channels of the output, whatever the input has
  std::uint32_t outEach = 0;   ///< and for each channel of the input
  bool takesMoreOut = false;   ///< an output of more channels is documented
  bool isKept = false;         ///< the processor is built once, and reads a later input of another type
  bool isParallel = false;
  bool collects = false;  ///< the output is not touched
  bool isLength = false;  ///< n equal channels make a result sqrt(n) times as large
};

std::ostream& operator<<(std::ostream& stream, const Operator& op);

/// All 25 operators, some with more than one set of parameters.
const std::vector<Operator>& Operators();

struct Types {
  tessel::DataType in;
  tessel::DataType reference;
  tessel::DataType out;
};

/// Combinations of types that an operator takes: equal ones, narrow to wide, wide to narrow, integers of 64
/// bits, and complex ones if they are taken.
std::vector<Types> TypesOf(const Operator& op);

/// The rasters of a call.
struct Shape {
  std::uint32_t width = 8;
  std::uint32_t height = 8;
  std::uint32_t channels = 3;  ///< of the input and the reference
  std::uint32_t margin = 1;    ///< of the input; the other rasters and the mask have others
  std::uint32_t moreOut = 0;   ///< channels of the output beyond those that are written
  bool isMasked = false;
  std::uint32_t firstSample = 0;  ///< channel c gets what channel c + `firstSample` gets elsewhere
  bool isEven = false;            ///< all channels of a pixel are equal
};

/// Rasters full of numbers that all types hold, sentinels in the output, and masks.
class Scene {
 public:
  /// Where `bytes` bytes of raster 0 (input), 1 (reference) or 2 (output) lie.
  using Memory = std::function<unsigned char*(std::size_t raster, std::size_t bytes)>;

  Scene(const Operator& op, const Shape& shape, const Types& types, const Memory& memory = {});

  Call Get();

  /// Fills the output with sentinels.
  void Clear();

  /// All bytes of raster 0, 1 or 2, margins included.
  std::vector<unsigned char> Bytes(std::size_t raster) const;

  /// Sample c of pixel i of the buffer of the output.
  double Result(std::size_t pixel, std::uint32_t c) const;

  bool IsUntouched() const;
  bool IsMarginUntouched() const;
  std::size_t OutPixels() const { return std::size_t{out_->bufferWidth} * out_->bufferHeight; }

 private:
  std::vector<std::uint64_t> own_[3];
  std::optional<tessel::Raster> in_, reference_, out_;
  std::optional<tessel::Mask> mask_, excluding_;
  bool isMasked_;
};

/// Keeps the lines that `SqrGradientEvaluation` prints out of sight.
class Silence {
 public:
  Silence();
  Silence(const Silence&) = delete;
  Silence& operator=(const Silence&) = delete;
  ~Silence();

 private:
  int kept_;
};

}  // namespace orvik::attack
