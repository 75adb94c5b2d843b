#pragma once

namespace glimmet {

/// The process's share of SDL's audio subsystem, which every document
/// window's playback graph uses. The first user brings it up with the driver
/// SDL picks (SDL_AUDIODRIVER, else the first that works); the last one
/// takes it down. Application and stream names reach the sound server
/// through SDL's hints.
///
/// Thread use: window thread; the counts are guarded by a mutex of their own.
class AudioSystem {
public:
    /// Takes one share; false (taking none) when no driver comes up.
    static bool Acquire();
    static void Release();
    /// Restarts the subsystem on the named driver and gives the caller a
    /// share on it. Refused (false, shares untouched) while others hold
    /// shares, since their devices would be closed. *holding tells whether
    /// the caller holds a share afterwards: a driver that fails leaves none.
    static bool SwitchDriver(const char* driver, bool holding, bool* stillHolding);
    /// The driver in use, or null when the subsystem is down.
    static const char* CurrentDriver();
    static int Users();
};

}  // namespace glimmet
