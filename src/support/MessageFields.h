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

// Objects of this process.
inline constexpr const char* kFieldWindow = "window";
inline constexpr const char* kFieldChannel = "channel";
inline constexpr const char* kFieldSampleView = "sample view";

// Controls.
inline constexpr const char* kFieldWhen = "when";
inline constexpr const char* kFieldSource = "source";

// Document notifications: the channel concerned.
inline constexpr const char* kFieldIndex = "index";

}  // namespace glimmet
