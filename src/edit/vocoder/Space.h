#pragma once

#include <cstddef>
#include <memory>

namespace glimmet {

/// Zeroed storage of max(n * size, 8192) bytes. When memory is short the
/// vocoder cannot go on: "No Memory!" goes to standard error and the program
/// ends with exit status -1.
void* space(int n, int size);

/// Frees what space returned.
struct SpaceDeleter {
    void operator()(void* block) const;
};

/// space for n floats, owned; never fewer than 2048 of them.
std::unique_ptr<float[], SpaceDeleter> FloatSpace(int n);

}  // namespace glimmet
