#include "edit/vocoder/Space.h"

#include <algorithm>
#include <cstdlib>

#include "support/Diagnostics.h"

namespace glimmet {

namespace {

// Every block is at least this large, so that small sizes still leave room.
constexpr size_t kMinimumBytes = 8192;

}  // namespace

void* space(int n, int size)
{
    const long long wanted = (long long)n * (long long)size;
    const size_t bytes = std::max(size_t(wanted > 0 ? wanted : 0), kMinimumBytes);
    // Zeroed, so that nothing read from a fresh block is left to chance.
    void* block = std::calloc(bytes, 1);
    if (block == nullptr) {
        Diagnostics::PrintError("No Memory!\n");
        std::exit(-1);
    }
    return block;
}

void SpaceDeleter::operator()(void* block) const
{
    std::free(block);
}

std::unique_ptr<float[], SpaceDeleter> FloatSpace(int n)
{
    return std::unique_ptr<float[], SpaceDeleter>(static_cast<float*>(space(n, int(sizeof(float)))));
}

}  // namespace glimmet
