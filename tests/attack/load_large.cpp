#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <exception>
#include <fstream>
#include <iterator>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/attack/guardedpages.h"
#include "tests/attack/operators.h"

// Large images, each in one call between pages without access. The result is the one that the operator has on
// many small parts of the image. Each line is a process of its own, of which the peak of memory is told.
namespace orvik::attack {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

constexpr std::uint32_t kEdge = 16384;
constexpr std::uint64_t kMostSamples = std::numeric_limits<std::int32_t>::max();
constexpr double kGigabyte = 1e9;

bool IsNamed(const Operator& op, std::string_view start) {
  return std::string_view(op.name).starts_with(start);
}

/// What a call gets: bytes, one or two dates, and what becomes of them.
struct Image {
  const Operator* op;
  std::uint32_t width, height, channels;
  std::uint32_t margin;  ///< of the input and the reference
  DataType out;

  bool IsRow() const { return height == 1; }
  std::uint64_t InPixels() const { return std::uint64_t{width + 2 * margin} * (height + 2 * margin); }
  std::uint64_t InBytes() const { return InPixels() * channels; }
  std::uint64_t ReferenceBytes() const { return op->takes == Takes::kPair ? 0 : InBytes(); }
  std::uint32_t OutChannels() const { return op->outFixed + op->outEach * channels; }
  std::uint64_t OutPixelBytes() const { return std::uint64_t{OutChannels()} * (out.sizeBits / 8); }
  std::uint64_t OutBytes() const {
    return op->collects ? 0 : std::uint64_t{width} * height * OutPixelBytes();
  }
  /// Two masks, and one with a byte for each bit.
  std::uint64_t MaskBytes() const { return InPixels() / 4 + InPixels(); }
  std::uint64_t Needed() const { return InBytes() + ReferenceBytes() + OutBytes() + MaskBytes(); }

  /// The parts are mirrored by themselves, and stand in reversed order.
  bool IsMirrored() const { return op->name == std::string_view(IsRow() ? "MirrorImg" : "MirrorImg, HORI"); }
  /// What a mask leaves out moves the mirrored pixels of all parts.
  bool IsMasked() const { return !IsMirrored(); }
};

/// Some rows of an image, or columns if it is a single row.
struct Part {
  std::uint32_t first;
  std::uint32_t count;
};

/// The part as a raster that lies within the other one, margins included.
Raster PartOf(const Raster& whole, Part part, bool isRow) {
  tessel::RasterInfo info = whole;
  tessel::RasterContext context = whole;
  (isRow ? info.width : info.height) = part.count;
  (isRow ? context.originX : context.originY) = part.first;
  const std::uint64_t pixels = std::uint64_t{part.first} * (isRow ? 1 : whole.bufferWidth);
  return Raster(info, context, whole.data + pixels * whole.channels * (whole.dataType.sizeBits / 8));
}

/// The same of a mask. The bits of the part begin with a byte: it begins with a multiple of 8.
Mask PartOf(const Mask& whole, Part part, bool isRow) {
  Mask mask(isRow ? part.count : whole.width, isRow ? whole.height : part.count, whole);
  const std::size_t begin = std::size_t{part.first} * (isRow ? 1 : whole.bufferWidth) / 8;
  std::copy_n(whole.bits.begin() + static_cast<std::ptrdiff_t>(begin),
              std::min(mask.bits.size(), whole.bits.size() - begin), mask.bits.begin());
  return mask;
}

/// Repeats a pattern whose length is prime: what lies a power of two apart differs.
void Fill(unsigned char* bytes, std::uint64_t count, std::size_t length, std::uint64_t seed,
          unsigned char (*byteOf)(std::uint64_t random)) {
  std::vector<unsigned char> pattern(length);
  for (unsigned char& byte : pattern) {
    seed = seed * 6364136223846793005u + 1442695040888963407u;
    byte = byteOf(seed >> 33);
  }
  for (std::uint64_t i = 0; i < count; i += length)
    std::memcpy(bytes + i, pattern.data(), std::min<std::uint64_t>(length, count - i));
}

unsigned char SampleOf(std::uint64_t random) { return static_cast<unsigned char>(random % 120); }
unsigned char MaskByteOf(std::uint64_t random) { return static_cast<unsigned char>(random | random >> 8); }

/// The rasters and masks of an image, filled.
class Whole {
 public:
  explicit Whole(const Image& image)
      : image_(image),
        pages_{GuardedPages(image.InBytes()), GuardedPages(image.ReferenceBytes()),
               GuardedPages(image.OutBytes())},
        in_(Made(0, image.InBytes(), image.channels, image.margin)),
        reference_(Made(1, image.ReferenceBytes(), image.channels, image.margin)),
        out_(Made(2, image.OutBytes(), image.OutChannels(), 0)) {
    Fill(in_.data, image.InBytes(), 1000003, 1, SampleOf);
    Fill(reference_.data, image.ReferenceBytes(), 999983, 2, SampleOf);
    if (image.IsMasked()) FillMasks();
  }

  /// Calls an object on the whole image and others on its parts. Returns the number of parts; 0 if the
  /// results differ.
  std::size_t Compare() {
    const std::unique_ptr<Object> object = image_.op->make(image_.channels);
    Process(*object, {0, image_.IsRow() ? image_.width : image_.height}, Out(out_), true);
    return image_.op->collects ? CompareCollected(*object) : CompareOutput();
  }

 private:
  Raster Made(std::size_t raster, std::uint64_t bytes, std::uint32_t channels, std::uint32_t margin) const {
    const DataType type = raster == 2 ? image_.out : DataType(tessel::eDT_8U);
    return Raster(tessel::RasterInfo(image_.width, image_.height, channels, type),
                  tessel::RasterContext(margin, margin), pages_[raster].Place(bytes, true));
  }

  Raster* Out(Raster& raster) const { return image_.op->collects ? nullptr : &raster; }

  void FillMasks() {
    const tessel::RasterContext margins(image_.margin, image_.margin);
    mask_.emplace(image_.width, image_.height, margins);
    Fill(mask_->bits.data(), mask_->bits.size(), 65521, 3, MaskByteOf);
    // A mirrored window that does not start at the edge takes its pixels from beyond it.
    for (std::uint32_t y = 0; y < image_.height; ++y) mask_->SetValid(0, static_cast<int>(y), true);
    if (image_.op->takes != Takes::kTriple) return;
    excluding_ = mask_;
    for (unsigned char& byte : excluding_->bits) byte = static_cast<unsigned char>(~byte);
  }

  /// The rows of the input that `IIIDataTransfer` takes those of a part of the output from.
  Part InputOf(Part part) const {
    if (!IsNamed(*image_.op, "IIIDataTransfer")) return part;
    const auto nearest = [&](std::uint64_t y) { return static_cast<std::uint32_t>((16 * y + 13) / 26); };
    const std::uint32_t first = nearest(part.first);
    return {first, std::min(nearest(part.first + part.count - 1) + 1, image_.height) - first};
  }

  void Process(Object& object, Part part, Raster* out, bool isWhole) const {
    const Silence silence;
    const bool isRow = image_.IsRow();
    Raster in = PartOf(in_, isWhole ? part : InputOf(part), isRow);
    Raster reference = PartOf(reference_, part, isRow);
    std::optional<Mask> mask, excluding;
    if (mask_) mask = PartOf(*mask_, part, isRow);
    if (excluding_) excluding = PartOf(*excluding_, part, isRow);
    const auto pointer = [](std::optional<Mask>& some) { return some ? &*some : nullptr; };
    object.Process({&in, &reference, pointer(mask), pointer(excluding), out});
  }

  /// Calls `visit(part)` for each part. Parts have `overlap` rows in common.
  template <class Visit>
  void ForEachPart(std::uint32_t overlap, Visit visit) const {
    const std::uint32_t all = image_.IsRow() ? image_.width : image_.height;
    const std::uint64_t rowSamples = image_.IsRow() ? 1 : std::uint64_t{image_.width} * image_.channels;
    const auto step = static_cast<std::uint32_t>(std::max<std::uint64_t>((1 << 19) / rowSamples, 1) * 8);
    for (std::uint64_t first = 0; first < all; first += step) {
      const std::uint64_t count = std::min<std::uint64_t>(step + overlap, all - first);
      if (count > overlap) visit(Part{static_cast<std::uint32_t>(first), static_cast<std::uint32_t>(count)});
    }
  }

  std::size_t CompareOutput() const {
    const std::unique_ptr<Object> object = image_.op->make(image_.channels);
    const std::uint32_t all = image_.IsRow() ? image_.width : image_.height;
    std::size_t parts = 0;
    bool areEqual = true;
    ForEachPart(0, [&](Part part) {
      const Part place = {image_.IsMirrored() ? all - part.first - part.count : part.first, part.count};
      const Raster wanted = PartOf(out_, place, image_.IsRow());
      const std::uint64_t bytes = std::uint64_t{wanted.width} * wanted.height * image_.OutPixelBytes();
      std::vector<unsigned char> own(bytes);
      tessel::RasterContext context(0, 0, wanted.originX, wanted.originY);
      Raster out(wanted, context, own.data());
      Process(*object, part, &out, false);
      areEqual = areEqual && std::memcmp(own.data(), wanted.data, bytes) == 0;
      ++parts;
    });
    return areEqual ? parts : 0;
  }

  /// The sums of all parts; what a `RasterStatistics` counts goes on from part to part.
  std::size_t CompareCollected(Object& whole) const {
    const bool isFresh = IsNamed(*image_.op, "SqrGradient");
    std::unique_ptr<Object> object = image_.op->make(image_.channels);
    std::vector<double> sums(whole.Collected().size(), 0.0);
    std::size_t parts = 0;
    ForEachPart(isFresh ? 1 : 0, [&](Part part) {
      if (isFresh) object = image_.op->make(image_.channels);
      Process(*object, part, nullptr, false);
      const std::vector<double> some = object->Collected();
      for (std::size_t i = 0; i < sums.size(); ++i) sums[i] = isFresh ? sums[i] + some.at(i) : some.at(i);
      ++parts;
    });
    // Of a single row the gradient has nothing to sum.
    return sums == whole.Collected() ? std::max<std::size_t>(parts, 1) : 0;
  }

  const Image& image_;
  GuardedPages pages_[3];
  Raster in_, reference_, out_;
  std::optional<Mask> mask_, excluding_;
};

// ---- lines

/// Images of one operator that are tried one after the other; the last one is the largest.
using Line = std::vector<Image>;

std::uint64_t Available() {
  std::ifstream file("/proc/meminfo");
  for (std::string name; file >> name;) {
    std::uint64_t kibibytes = 0;
    if (name == "MemAvailable:" && file >> kibibytes) return kibibytes * 1024;
  }
  return 0;
}

/// In a process of its own. Exits with 0 if all is equal.
[[noreturn]] void TryAll(const Line& line, int result) {
  std::size_t parts = 0;
  try {
    for (const Image& image : line) {
      parts = Whole(image).Compare();
      if (parts == 0) break;
    }
  } catch (const std::exception& exception) {
    std::fprintf(stderr, "%s: %s\n", line.front().op->name, exception.what());
    _exit(2);
  }
  if (write(result, &parts, sizeof(parts)) != sizeof(parts)) _exit(2);
  _exit(parts == 0 ? 1 : 0);
}

/// Returns true if the results are equal. Leaves how many parts there were, and the peak of memory.
bool Try(const Line& line, std::size_t& parts, double& peak) {
  int ends[2];
  if (pipe(ends) != 0) return false;
  const pid_t child = fork();
  if (child == 0) TryAll(line, ends[1]);
  int status = -1;
  rusage usage = {};
  const bool isOver = child > 0 && wait4(child, &status, 0, &usage) == child;
  const bool isEqual = isOver && WIFEXITED(status) && WEXITSTATUS(status) == 0 &&
                       read(ends[0], &parts, sizeof(parts)) == sizeof(parts);
  if (isOver && WIFSIGNALED(status)) std::printf("ended by signal %d: ", WTERMSIG(status));
  close(ends[0]);
  close(ends[1]);
  peak = static_cast<double>(usage.ru_maxrss) * 1024 / kGigabyte;
  return isEqual;
}

/// Prints what comes out. Returns false if it is not what is wanted, or there is no room for it.
bool Report(const Line& line) {
  const Image& image = line.back();
  std::printf("%-24s %s%10u x %5u x %2u, bytes to %s %11llu samples: ", image.op->name,
              line.size() > 1 ? "to " : "   ", image.width, image.height, image.channels,
              image.out == tessel::eDT_8U ? "bytes, " : "floats,",
              static_cast<unsigned long long>(image.InBytes()));
  constexpr std::uint64_t reserve = 1 << 28;
  const std::uint64_t available = Available();
  if (available < image.Needed() + reserve) {
    std::printf("NOT RUN, it needs %.1f GB of memory and %.1f are available\n",
                static_cast<double>(image.Needed() + reserve) / kGigabyte,
                static_cast<double>(available) / kGigabyte);
    return false;
  }
  std::fflush(stdout);
  std::size_t parts = 0;
  double peak = 0.0;
  const bool isEqual = Try(line, parts, peak);
  if (isEqual) std::printf("equal in %4zu parts, %4.1f GB at the peak\n", parts, peak);
  if (!isEqual) std::printf("DIFFERS from its parts\n");
  std::fflush(stdout);
  return isEqual;
}

// ---- images

std::uint32_t ChannelsOf(const Operator& op) { return std::max(op.least, op.read); }

/// Square images, of sizes up to the largest one.
std::vector<Line> Tiles(const Operator& op) {
  Line smaller;
  for (std::uint32_t edge = 1; edge < kEdge; edge *= 2)
    smaller.push_back({&op, edge, edge, ChannelsOf(op), 1, tessel::eDT_8U});
  Image image = {&op, kEdge, kEdge, ChannelsOf(op), 1, tessel::eDT_8U};
  std::vector<Line> lines = {smaller, {image}};
  if (op.collects) return lines;
  image.out = tessel::eDT_32F;
  lines.push_back({image});
  return lines;
}

/// As many samples as before, in 1 to 64 channels.
std::vector<Line> Channels(const Operator& op) {
  Line line;
  for (std::uint32_t channels = op.least; channels < 64; ++channels)
    line.push_back({&op, 61, 67, channels, 1, tessel::eDT_8U});
  line.push_back({&op, kEdge / 8, kEdge / 8, 64, 1, tessel::eDT_8U});
  return {line};
}

/// As many samples as an `int` can count: in one row, or where rows matter in about as many rows as columns.
std::vector<Line> Samples(const Operator& op) {
  const std::uint64_t pixels = kMostSamples / ChannelsOf(op);
  Image image = {&op, static_cast<std::uint32_t>(pixels), 1, ChannelsOf(op), 0, tessel::eDT_8U};
  for (const char* name : {"Filter", "MirrorImg, HORI", "SqrGradient", "Vollath", "IIIDataTransfer"}) {
    if (!IsNamed(op, name)) continue;
    image.margin = 1;
    image.width = 46340 - 2;
    image.height = static_cast<std::uint32_t>(pixels / 46340) - 2;
  }
  return {{image}};
}

struct Load {
  const char* name;
  std::vector<Line> (*lines)(const Operator& op);
};
constexpr Load kLoads[] = {{"tiles", Tiles}, {"channels", Channels}, {"samples", Samples}};

bool IsLoad(std::string_view name) {
  return std::any_of(std::begin(kLoads), std::end(kLoads),
                     [=](const Load& load) { return name == load.name; });
}

/// The lines of the named loads, or of all, and of the operators whose names begin with one of the others.
int Run(const std::vector<std::string_view>& arguments) {
  std::printf("%.1f GB of memory are available\n", static_cast<double>(Available()) / kGigabyte);
  const auto isChosen = [&](bool isLoad, auto matches) {
    const auto isOfKind = [=](std::string_view argument) { return IsLoad(argument) == isLoad; };
    return std::none_of(arguments.begin(), arguments.end(), isOfKind) ||
           std::any_of(arguments.begin(), arguments.end(), matches);
  };
  bool isGood = true;
  for (const Load& load : kLoads) {
    if (!isChosen(true, [&](std::string_view argument) { return argument == load.name; })) continue;
    for (const Operator& op : Operators()) {
      if (!isChosen(false, [&](std::string_view argument) { return IsNamed(op, argument); })) continue;
      for (const Line& line : load.lines(op)) isGood = Report(line) && isGood;
    }
  }
  return isGood ? 0 : 1;
}

}  // namespace
}  // namespace orvik::attack

int main(int count, char** arguments) { return orvik::attack::Run({arguments + 1, arguments + count}); }
