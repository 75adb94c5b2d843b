#pragma once

#include "support/Status.h"

namespace glimmet {

/// The status code for a C library errno value (B_OK for 0).
status_t StatusFromErrno(int error);

/// The status for errno whose text is the C library's own for it: a named
/// code where that says the same ("Permission denied", "No space left on
/// device"), else the errno kept as it is. For reports that must name the
/// real cause of a failed call ("Read-only file system", "File too large").
status_t ExactStatusFromErrno(int error);

}  // namespace glimmet
