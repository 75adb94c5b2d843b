#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

#include "sound/SampleAllocator.h"

namespace glimmet {

/// The samples last copied in any window, shared by all windows so that a
/// paste in one document can use what was copied in another: one sample
/// array per copied channel, each of the same frame count.
///
/// The application object owns the one buffer of the process and hands it to
/// whatever copies or pastes (SelectionCopier, PasteAction).
class CopyBuffer {
public:
    /// From the shared SampleAllocator, or adopted from new[] (the default
    /// deleter of an array without an allocator is delete[]).
    using Samples = SampleAllocator::Array;

    CopyBuffer() = default;
    CopyBuffer(const CopyBuffer&) = delete;
    CopyBuffer& operator=(const CopyBuffer&) = delete;

    /// Takes over the channel arrays, each holding frames samples, and frees
    /// the ones held so far. Refused (false, the old buffer stays and the
    /// passed arrays are freed) when channels is empty or frames is below 1.
    bool SetCopyBuffer(std::vector<Samples> channels, int64_t frames);

    /// The held arrays, shared and not copied: they stay valid until the
    /// next accepted SetCopyBuffer. False, leaving the outputs untouched,
    /// when nothing has been copied.
    bool GetCopyBuffer(std::vector<const int16_t*>& channels, int32_t& count, int64_t& frames) const;

private:
    // Copy and paste run in the GUI thread; the lock only makes a stray call
    // from another thread well defined.
    mutable std::mutex lock_;
    std::vector<Samples> channels_;  // guarded by lock_
    int64_t frames_ = 0;             // guarded by lock_
};

}  // namespace glimmet
