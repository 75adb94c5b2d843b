#include "sound/SampleSlice.h"

#include <cstring>

namespace glimmet {

void SampleSlice::CopyTo(int16_t* destination) const
{
    blocks.MakeResident();
    std::memset(destination, 0, size_t(leading) * sizeof(int16_t));
    blocks.CopyOut(0, blocks.Count(), destination + leading);
    std::memset(destination + leading + blocks.Count(), 0, size_t(trailing) * sizeof(int16_t));
}

}  // namespace glimmet
