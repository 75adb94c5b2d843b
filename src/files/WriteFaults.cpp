#include "files/WriteFaults.h"

#include <array>
#include <atomic>

namespace glimmet {

namespace {

std::array<std::atomic<int>, size_t(WriteFaults::Step::kCount)>& Errors()
{
    static std::array<std::atomic<int>, size_t(WriteFaults::Step::kCount)> errors{};
    return errors;
}

}  // namespace

void WriteFaults::Inject(Step step, int error)
{
    if (step < Step::kCount)
        Errors()[size_t(step)].store(error, std::memory_order_relaxed);
}

void WriteFaults::Clear()
{
    for (auto& error : Errors())
        error.store(0, std::memory_order_relaxed);
}

int WriteFaults::ErrorFor(Step step)
{
    return step < Step::kCount ? Errors()[size_t(step)].load(std::memory_order_relaxed) : 0;
}

}  // namespace glimmet
