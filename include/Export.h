#pragma once

// Marks what a shared library of ours offers to other modules; everything else stays hidden.
#define TESSEL_EXPORT __attribute__((visibility("default")))
