#include "support/SystemTime.h"

#include <chrono>
#include <thread>

namespace glimmet {

int64_t system_time()
{
    using namespace std::chrono;
    return duration_cast<microseconds>(steady_clock::now().time_since_epoch()).count();
}

void snooze(int64_t micros)
{
    if (micros > 0)
        std::this_thread::sleep_for(std::chrono::microseconds(micros));
}

}  // namespace glimmet
