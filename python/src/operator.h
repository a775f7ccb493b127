#pragma once

#include <array>
#include <atomic>
#include <memory>
#include <mutex>
#include <new>
#include <stdexcept>
#include <thread>
#include <type_traits>
#include <utility>

#include <pybind11/pybind11.h>
#include <pybind11/stl.h>

#include "arrays.h"

/// What all operators share on their way to Python.
namespace gridmill::python {

/// Which data types an operator compares to decide whether it builds its inner processor anew.
enum class Rebuilds {
  kOnAnyType,
  kOnInputType,
  kNever,
};

/// The element types of a call, in the order in which the operator compares them.
using CallTypes = std::array<DataType, 3>;

/// For an operator whose parameters cannot lead it out of an array.
struct NoLimits {
  NoLimits() = default;
  template <class Op>
  explicit NoLimits(const Op&) {}
};

/// A thread's turn with an object.
class Turn {
 public:
  Turn(std::mutex& mutex, std::atomic<std::thread::id>& owner) : mutex_(mutex), owner_(owner) {
    if (owner == std::this_thread::get_id())
      throw std::runtime_error("the object is in the middle of a call; use another object");
    if (!mutex_.try_lock()) {
      const py::gil_scoped_release release;
      mutex_.lock();
    }
    owner_ = std::this_thread::get_id();
  }
  ~Turn() {
    owner_ = std::thread::id();
    mutex_.unlock();
  }
  Turn(const Turn&) = delete;
  Turn& operator=(const Turn&) = delete;

 private:
  std::mutex& mutex_;
  std::atomic<std::thread::id>& owner_;
};

/// An operator of the core as a Python object holds it.
///
/// The core reads its parameters when it builds an inner processor and compares nothing with them later. So
/// this keeps, of the parameters of the last build, what a call has to respect.
///
/// @tparam Limits  constructed from the operator when it is about to build
template <class Op, Rebuilds kRebuilds, class Limits = NoLimits>
class Operator {
 public:
  template <class... Arguments>
  explicit Operator(Arguments&&... arguments) : op(std::forward<Arguments>(arguments)...) {}

  /// One thread at a time: others wait, without holding the GIL.
  ///
  /// @throws RuntimeError  where Python code that a call runs in between, a signal's handler or a decision,
  ///                       turns to the object of that call
  Turn Enter() { return Turn(mutex_, owner_); }

  /// The limits of the processor that a call with these types will run.
  Limits LimitsFor(const CallTypes& types, const char* firstArgument = "image") const {
    if (broken_) {
      PyErr_SetString(PyExc_MemoryError, "an earlier call ran out of memory; use a new object");
      throw py::error_already_set();
    }
    if (!built_ || (kRebuilds == Rebuilds::kOnAnyType && types != types_) ||
        (kRebuilds == Rebuilds::kOnInputType && types[0] != types_[0]))
      return Limits(op);
    RequireKept(firstArgument, types[0], types_[0]);
    RequireKept("out", types[1], types_[1]);
    return limits_;
  }

  /// Runs the core without the GIL.
  template <class Work>
  void Run(const CallTypes& types, const Limits& limits, Work work) {
    types_ = types;
    limits_ = limits;
    built_ = true;
    try {
      const py::gil_scoped_release release;
      work();
    } catch (const std::bad_alloc&) {
      broken_ = true;  // whether the new processor stands is not known
      throw;
    }
  }

  bool Built() const { return built_; }
  const Limits& Last() const { return limits_; }

  Op op;

 private:
  static void RequireKept(const char* argument, const DataType& type, const DataType& kept) {
    if (kRebuilds != Rebuilds::kOnAnyType && type != kept)
      RaiseType(argument, "an array of " + NameOf(type),
                NameOf(kept) + ", for which this object was built; use a new object");
  }

  std::mutex mutex_;
  std::atomic<std::thread::id> owner_{};
  CallTypes types_;
  Limits limits_;
  bool built_ = false;
  bool broken_ = false;
};

template <class Holder, class Base, class Result, class... Arguments>
auto Setter(Result (Base::*set)(Arguments...)) {
  return [set](Holder& self, std::decay_t<Arguments>... values) {
    const Turn turn = self.Enter();
    return (self.op.*set)(values...);
  };
}

template <class Holder, class Base, class Value>
auto Field(Value Base::*field) {
  return [field](Holder& self) {
    const Turn turn = self.Enter();
    return self.op.*field;
  };
}

/// A setter and the field that it sets.
template <class Holder, class Class, class Base, class Value, class Set>
void Parameter(Class& type, const char* setter, Set set, const char* field, Value Base::*member) {
  type.def(setter, Setter<Holder>(set), py::arg("value"));
  type.def_property_readonly(field, Field<Holder>(member));
}

/// Counts from Python: an int32 array in one go, else any sequence.
std::vector<int> CountsOf(const py::object& counts);

/// The rest of `Process` for an operator that goes pixel by pixel from one image to another.
template <class Holder, class Limits>
void RunOverBands(Holder& self, const Limits& limits, const Image& image, const Validity& mask,
                  const Image& out) {
  self.Run({image.type, out.type}, limits, [&] {
    const std::size_t rowBytes = image.width * (image.PixelBytes() + out.PixelBytes());
    InBands(image.height, rowBytes, [&](std::size_t first, std::size_t rows) {
      Raster in = image.Rows(first, rows), target = out.Rows(first, rows);
      std::optional<Mask> valid = mask.Rows(first, rows);
      self.op.Process(&in, Pointer(valid), &target);
    });
  });
}

/// The checks that all operators from one image to another of its size share.
inline void RequireFit(const Image& image, const Validity& mask, const Image& out) {
  mask.RequireSizeOf(image);
  out.RequireSize(image.height, image.width);
  out.RequireApart(image);
  mask.RequireApart(out);
}

void BindTerrain(py::module_& module);
void BindFilters(py::module_& module);
void BindStretches(py::module_& module);
void BindFocus(py::module_& module);
void BindChange(py::module_& module);
void BindStatistics(py::module_& module);
void BindServices(py::module_& module);

}  // namespace gridmill::python
