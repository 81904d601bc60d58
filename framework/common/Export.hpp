#pragma once

/// Marks what a shared library of this project offers to the outside; everything else is hidden.
#define VELKOR_EXPORT __attribute__((visibility("default")))
