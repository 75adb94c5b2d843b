#pragma once

#include "support/Status.h"

namespace glimmet {

/// The status code for a C library errno value (B_OK for 0).
status_t StatusFromErrno(int error);

}  // namespace glimmet
