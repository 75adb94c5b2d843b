#include "ViewFixture.h"

namespace glimmet::test {

int64_t ManualClock::now = 0;

}  // namespace glimmet::test
