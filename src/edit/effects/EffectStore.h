#pragma once

#include <cstdint>

namespace glimmet::effects {

/// Conversions from the effects' double results to integers, shared by the
/// curve-driven effects so that they all truncate the same way.

/// value truncated toward zero to an int32. A value no int32 can hold,
/// not-a-number included, gives INT32_MIN, which is what the processor's
/// own conversion yields; C++ leaves that case undefined, so it is spelled
/// out here.
inline int32_t TruncateToInt32(double value)
{
    if (value < 2147483648.0 && value > -2147483649.0) {
        return int32_t(value);
    }
    return INT32_MIN;
}

/// The low 16 bits of value truncated toward zero to an int32: no clipping,
/// the way Peak Distort has always stored its scaled samples.
inline int16_t StoreLow16(double value)
{
    return int16_t(uint16_t(uint32_t(TruncateToInt32(value))));
}

/// value truncated toward zero; a result outside the 16-bit range is stored
/// as 32767 whichever side it left on. The one-sided store is how Distort and
/// Envelope have always saturated, and users' results depend on it.
/// Not-a-number truncates to INT32_MIN and so also becomes 32767.
inline int16_t StoreOneSided(double value)
{
    const int32_t truncated = TruncateToInt32(value);
    if (truncated < -32768 || truncated > 32767) {
        return 32767;
    }
    return int16_t(truncated);
}

}  // namespace glimmet::effects
