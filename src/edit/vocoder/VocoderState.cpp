#include "edit/vocoder/VocoderState.h"

namespace glimmet {

VocoderState& VocoderState::Shared()
{
    static VocoderState state;
    return state;
}

void VocoderState::Reset()
{
    std::lock_guard guard(lock_);
    convert = ConvertMemory();
    unconvert = UnconvertMemory();
    oscillators = OscillatorMemory();
    rfftCalled = false;
}

}  // namespace glimmet
