# The flags on which the promise of the same bits everywhere rests. The library and its tests take them.
add_library(gridmill_numerics INTERFACE)
target_compile_options(
  gridmill_numerics
  INTERFACE -ffp-contract=off # no fused multiply-add
            -fno-fast-math
            -fno-math-errno # square roots without a call: errno is never looked at
            -fno-trapping-math # floating exceptions are never looked at
            -fsigned-char # `char` is the signed 8-bit pixel type on every platform
            -ffile-prefix-map=${PROJECT_SOURCE_DIR}/=)
target_compile_features(gridmill_numerics INTERFACE cxx_std_20)
