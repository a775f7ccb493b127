#pragma once

#include <array>
#include <cstddef>
#include <memory>

#include "basic/tessel/complexinterpretation.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/guards.h"

namespace orvik::frame {

/// The rasters of a call with every complex one but the output replaced by a real one, where the operator
/// asks for that. Owns what it makes.
template <bool interprets, std::size_t N>
class Interpreted {
 public:
  explicit Interpreted(const Rasters<N>& given) : rasters_(given) {
    if constexpr (interprets) {
      for (std::size_t i = 0; i + 1 < N; ++i) {
        if (!given[i]->dataType.isComplex) continue;
        const tessel::ComplexInterpretation interpretation;
        made_[i].reset(interpretation.InterpretRaster(given[i], core::eINTERPRETATION_REAL));
        rasters_[i] = made_[i].get();
      }
    }
  }

  const Rasters<N>& Get() const { return rasters_; }

 private:
  Rasters<N> rasters_;
  std::array<std::unique_ptr<tessel::Raster>, N - 1> made_;
};

}  // namespace orvik::frame
