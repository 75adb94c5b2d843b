#pragma once

namespace glimmet::help {

// The bubble help texts of a document window's views and controls. They are
// kept word for word as users of earlier versions know them, slips included
// ("Immediatly", and the "to" that ends one line and starts the next).

inline constexpr const char* kChannelContainerView =
    "Click left to select a range of the sample.\n"
    "Click right to get a context menu for that channel.\n"
    "Click and drag with the middle mouse button to\n"
    "to move the sample in the channel you clicked in.\n"
    "Double click with your left mouse button to select\n"
    "the whole sample in that channel.";

inline constexpr const char* kPlayButton =
    "Click left to start playing from the beginning\n"
    "or click right to start playing from the current\n"
    "cursor position. (Shift + Space)";

inline constexpr const char* kPlayModeButton =
    "Toggles playback (Space, if a sample view\n"
    "has keyboard focus, Control + Space otherwise)";

inline constexpr const char* kStopButton = "Immediatly stops playback";

inline constexpr const char* kPlayModePopup = "You can pick what part of the sample will be looped.";

}  // namespace glimmet::help
