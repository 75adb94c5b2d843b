#pragma once

#include <cstdint>

namespace glimmet {

/// The seven values of the time stretch dialog, as GetParameters reads them.
struct StretchParameters {
    int32_t fftLength = 0;
    int32_t windowSize = 0;
    int32_t decimation = 0;
    int32_t interpolation = 0;
    float stretch = 0.0f;
    float pitch = 0.0f;
    float gate = 0.0f;
};

/// What StretchAction needs of its parameter dialog, a window of the
/// application layer: the typed values and a say in when it closes. The
/// action owns the dialog through this interface from its constructor on;
/// deleting the interface closes the window if it is still open.
///
/// The dialog answers the document window directly ('acgo' from "Ok",
/// 'accc' from "Cancel" and the close box); the action only reads it.
class StretchDialog {
public:
    virtual ~StretchDialog() = default;

    /// Takes the dialog for reading; false when its window is gone.
    virtual bool Lock() = 0;
    virtual void Unlock() = 0;
    /// The seven texts parsed as base-10 integers and decimal floats, in
    /// the dialog's order. Caller holds the lock.
    virtual StretchParameters GetParameters() = 0;
    /// Closes the dialog for good.
    virtual void Quit() = 0;
};

}  // namespace glimmet
