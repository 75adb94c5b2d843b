#pragma once

#include <cstdint>

#include "support/MessageTarget.h"

namespace glimmet {

/// What the sound engine needs of the window that shows a document: a place
/// to post its notifications, the window's lock (only ever tried with a
/// time-out from the audio thread) and the frames the window shows.
class DocumentWindow : public MessageTarget {
public:
    /// Tries the window lock for at most timeoutMicros; true when held.
    virtual bool LockWithTimeout(int64_t timeoutMicros) = 0;
    virtual void UnlockWindow() = 0;
    /// The first and last frame on display, copied without any check.
    virtual void GetVisibleFrames(int64_t* first, int64_t* last) = 0;
};

}  // namespace glimmet
