#pragma once

namespace glimmet {

// The names of the fields that messages carry, in one place, so that the
// sender and the receiver of a message cannot spell a field differently.

// Frames.
inline constexpr const char* kFieldRangeStart = "range start";
inline constexpr const char* kFieldRangeEnd = "range end";
inline constexpr const char* kFieldCurrentFrame = "current frame";
inline constexpr const char* kFieldFirstFrame = "first frame";
inline constexpr const char* kFieldLastFrame = "last frame";
inline constexpr const char* kFieldOffset = "offset";
/// The zoom slider's handles, as frames ('dprs').
inline constexpr const char* kFieldLowValue = "low value";
inline constexpr const char* kFieldHighValue = "high value";

// Objects of this process.
inline constexpr const char* kFieldWindow = "window";
inline constexpr const char* kFieldChannel = "channel";
inline constexpr const char* kFieldSampleView = "sample view";

// Controls.
inline constexpr const char* kFieldWhen = "when";
inline constexpr const char* kFieldSource = "source";
inline constexpr const char* kFieldMode = "mode";
inline constexpr const char* kFieldEnable = "enable";
/// When a play position was reached, in microseconds of system time.
inline constexpr const char* kFieldTime = "time";
/// Which playback a play-position update or an end-of-range stop came from.
inline constexpr const char* kFieldPlaybackRun = "playback run";

// Files.
inline constexpr const char* kFieldRefs = "refs";
inline constexpr const char* kFieldModifiers = "modifiers";
inline constexpr const char* kFieldDirectory = "directory";
inline constexpr const char* kFieldName = "name";

// Notifications: the interest that matched, the notifier, and for a
// document's notifications the channel concerned.
inline constexpr const char* kFieldMask = "mask";
inline constexpr const char* kFieldObservable = "observable";
inline constexpr const char* kFieldIndex = "index";

}  // namespace glimmet
