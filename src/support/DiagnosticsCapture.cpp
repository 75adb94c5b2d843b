#include "support/DiagnosticsCapture.h"

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <mutex>
#include <vector>

namespace glimmet {

namespace {

// The captures alive at the moment, shared by every thread that prints.
// Made on first use so that a capture in a static object cannot meet it
// unconstructed.
struct Registry {
    std::mutex mutex;
    std::vector<DiagnosticsCapture*> live;  // guarded by mutex
    std::atomic<int> count{0};              // live.size(), readable without the lock
};

Registry& TheRegistry()
{
    static Registry registry;
    return registry;
}

}  // namespace

DiagnosticsCapture::DiagnosticsCapture(Diagnostics::Channel channel, PassOn passOn)
    : channel_(channel), passOn_(passOn)
{
    Registry& registry = TheRegistry();
    std::lock_guard lock(registry.mutex);
    registry.live.push_back(this);
    registry.count.store(int(registry.live.size()), std::memory_order_release);
}

DiagnosticsCapture::~DiagnosticsCapture()
{
    Finish();
}

std::string DiagnosticsCapture::Text() const
{
    std::lock_guard lock(TheRegistry().mutex);
    return text_;
}

std::string DiagnosticsCapture::Finish()
{
    Registry& registry = TheRegistry();
    std::lock_guard lock(registry.mutex);
    if (live_) {
        live_ = false;
        std::erase(registry.live, this);
        registry.count.store(int(registry.live.size()), std::memory_order_release);
    }
    return text_;
}

bool DiagnosticsCapture::AnyLive()
{
    return TheRegistry().count.load(std::memory_order_acquire) > 0;
}

bool DiagnosticsCapture::Collect(Diagnostics::Channel channel, const char* format, va_list arguments)
{
    Registry& registry = TheRegistry();
    std::lock_guard lock(registry.mutex);
    bool captured = false;
    bool passOn = false;
    std::string text;
    for (DiagnosticsCapture* capture : registry.live) {
        if (capture->channel_ != channel)
            continue;
        if (!captured) {
            va_list measuring;
            va_copy(measuring, arguments);
            const int length = std::vsnprintf(nullptr, 0, format, measuring);
            va_end(measuring);
            if (length > 0) {
                text.resize(size_t(length));
                std::vsnprintf(text.data(), size_t(length) + 1, format, arguments);
            }
            captured = true;
        }
        capture->text_ += text;
        passOn = passOn || capture->passOn_ == PassOn::Yes;
    }
    return !captured || passOn;
}

}  // namespace glimmet
