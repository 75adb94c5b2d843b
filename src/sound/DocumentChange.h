#pragma once

#include <cstdint>

namespace glimmet::DocumentChange {

// What a document tells its listeners (the masks of its Observable). Each
// notification carries "index" (int32), the channel concerned; a
// notification without it concerns every channel. Listeners are told on the
// thread that changed the document, after the document lock was let go.

/// A channel now stands at "index"; the ones from there on moved down.
inline constexpr uint32_t kChannelAdded = 1u << 0;
/// The channel that stood at "index" has left the document.
inline constexpr uint32_t kChannelRemoved = 1u << 1;
/// The samples, first frame, mute, pan or selection of a channel changed.
inline constexpr uint32_t kChannelData = 1u << 2;

inline constexpr uint32_t kAll = kChannelAdded | kChannelRemoved | kChannelData;

}  // namespace glimmet::DocumentChange
