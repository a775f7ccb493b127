#pragma once

/// Marks the classes that leave the shared library; every other symbol stays hidden.
#define GRIDMILL_EXPORT __attribute__((visibility("default")))
