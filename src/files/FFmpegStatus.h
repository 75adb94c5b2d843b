#pragma once

#include "support/Status.h"

namespace glimmet {

/// Turns an FFmpeg error (a negative AVERROR value) into the nearest status
/// code, so that callers and diagnostics see one family of codes.
status_t StatusFromAVError(int error);

}  // namespace glimmet
