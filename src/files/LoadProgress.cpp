#include "files/LoadProgress.h"

#include <algorithm>

namespace glimmet {

namespace {

thread_local LoadProgress* tCurrent = nullptr;

}  // namespace

LoadProgress::Scope::Scope(LoadProgress& progress) : previous_(tCurrent)
{
    tCurrent = &progress;
}

LoadProgress::Scope::~Scope()
{
    tCurrent = previous_;
}

double LoadProgress::Fraction() const
{
    const int64_t size = size_.load(std::memory_order_relaxed);
    if (size <= 0)
        return 0.0;
    return std::clamp(double(position_.load(std::memory_order_relaxed)) / double(size), 0.0, 1.0);
}

bool LoadProgress::Report(int64_t position, int64_t size)
{
    LoadProgress* progress = tCurrent;
    if (progress == nullptr)
        return true;
    progress->size_.store(size, std::memory_order_relaxed);
    progress->position_.store(std::max<int64_t>(position, 0), std::memory_order_relaxed);
    return !progress->IsCancelled();
}

void LoadProgress::PassStarted()
{
    if (LoadProgress* progress = tCurrent) {
        progress->position_.store(0, std::memory_order_relaxed);
        progress->passes_.fetch_add(1, std::memory_order_relaxed);
    }
}

}  // namespace glimmet
