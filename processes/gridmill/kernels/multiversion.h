#pragma once

/// `GRIDMILL_MULTIVERSION` in front of a kernel builds it for several instruction sets, of which the loader
/// picks the best that the processor has. `GRIDMILL_PINNED` leaves the choice to the compiler's flags. Other
/// compilers and processors build each kernel once, plainly. The results are the same bits everywhere.
#if !defined(GRIDMILL_PINNED) && defined(__x86_64__) && defined(__GNUC__) && !defined(__clang__)
#define GRIDMILL_MULTIVERSION __attribute__((target_clones("default", "arch=x86-64-v3", "arch=x86-64-v4")))
#else
#define GRIDMILL_MULTIVERSION
#endif

/// In front of a loop whose iterations touch different elements, also where a target is one of the sources:
/// an image may be computed in place. `__restrict` would promise too much there.
#if defined(__clang__)
#define GRIDMILL_INDEPENDENT _Pragma("clang loop vectorize(assume_safety)")
#else
#define GRIDMILL_INDEPENDENT _Pragma("GCC ivdep")
#endif

/// In front of the arithmetic that kernels share, so that each version gets its own copy.
#define GRIDMILL_INLINE inline __attribute__((always_inline))
