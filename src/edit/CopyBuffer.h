#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

#include "sound/SampleAllocator.h"
#include "sound/SampleSlice.h"

namespace glimmet {

/// The samples last copied in any window, shared by all windows so that a
/// paste in one document can use what was copied in another: one slice per
/// copied channel, each of the same frame count.
///
/// The slices share the blocks of the channels they were copied from, and
/// hold silence as a count: copying a range far past a short channel, or a
/// minute of a long one, costs references instead of a copy of the samples,
/// and a paste shares them on into the document.
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

    /// Takes the channels' slices, each of frames samples, in place of what
    /// was held. Refused (false, the old buffer stays) when channels is
    /// empty, frames is below 1 or a slice has another length.
    bool SetSlices(std::vector<SampleSlice> channels, int64_t frames);
    /// The held slices (their blocks shared). False, leaving the outputs
    /// untouched, when nothing has been copied.
    bool GetSlices(std::vector<SampleSlice>& channels, int64_t& frames) const;

    /// Takes over the channel arrays, each holding frames samples, as
    /// blocks, and frees them. Refused (false, the old buffer stays and the
    /// passed arrays are freed) when channels is empty, frames is below 1
    /// or memory for the blocks cannot be had.
    bool SetCopyBuffer(std::vector<Samples> channels, int64_t frames);

    /// The held channels as arrays, laid out on the first call after a copy
    /// and then shared: they stay valid until the next accepted copy. False,
    /// leaving the outputs untouched, when nothing has been copied or the
    /// arrays cannot be had.
    bool GetCopyBuffer(std::vector<const int16_t*>& channels, int32_t& count, int64_t& frames) const;

private:
    // Copy and paste run in the GUI thread; the lock only makes a stray call
    // from another thread well defined.
    mutable std::mutex lock_;
    std::vector<SampleSlice> channels_;  // guarded by lock_
    int64_t frames_ = 0;                 // guarded by lock_
    mutable std::vector<Samples> arrays_;  // guarded by lock_
};

}  // namespace glimmet
