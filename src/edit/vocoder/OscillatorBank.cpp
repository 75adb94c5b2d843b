#include "edit/vocoder/OscillatorBank.h"

#include <cmath>
#include <mutex>

#include "edit/vocoder/VocoderConstants.h"
#include "edit/vocoder/VocoderState.h"
#include "support/Diagnostics.h"

namespace glimmet {

float synt = 1e-8f;

namespace {

constexpr int L = OscillatorMemory::kTableLength;

void CreateOscillators(OscillatorMemory& memory, int N2, int R, int Nw, int I, float P)
{
    Diagnostics::PrintError("USING OSCILLATOR BANK RESYNTHESIS\n");
    memory.lastAmplitude.Allocate(N2 + 1);
    memory.lastFrequency.Allocate(N2 + 1);
    memory.index.Allocate(N2 + 1);
    const float scale = Nw < N2 ? float(8 * N2) : float(N2);
    memory.table.resize(L);
    for (int n = 0; n < L; n++)
        memory.table[size_t(n)] = float(scale * std::cos(kVocoderTwoPi * n / L));
    memory.inverseHop = 1.0f / float(I);
    memory.tableIncrement = P * float(L) / float(R);
    memory.bins = P > 1.0f ? int(float(N2) / P) : N2;
    memory.created = true;
}

// The table holds one period; an address that is not a number (only
// reachable from a frame that is not) reads 0 rather than outside it.
float TableAt(const OscillatorMemory& memory, float address)
{
    if (!(address >= 0.0f && address < float(L)))
        return 0.0f;
    const int slot = int(address);
    return slot < L ? memory.table[size_t(slot)] : 0.0f;
}

// An infinite address would never come back into the table.
float WrappedAddress(float address)
{
    if (!std::isfinite(address))
        return address;
    while (address >= float(L))
        address -= float(L);
    while (address < 0.0f)
        address += float(L);
    return address;
}

void SoundBin(OscillatorMemory& memory, float* C, int b, int I, float* O)
{
    C[2 * b + 1] *= memory.tableIncrement;
    float f = memory.lastFrequency[b];
    float a = memory.lastAmplitude[b];
    const float finc = (C[2 * b + 1] - f) * memory.inverseHop;
    const float ainc = (C[2 * b] - a) * memory.inverseHop;
    float address = memory.index[b];
    for (int n = 0; n < I; n++) {
        O[n] += a * TableAt(memory, address);
        address = WrappedAddress(address + f);
        a += ainc;
        f += finc;
    }
    memory.lastFrequency[b] = C[2 * b + 1];
    memory.lastAmplitude[b] = C[2 * b];
    memory.index[b] = address;
}

}  // namespace

void noscbank(float* C, int N2, int R, int Nw, int I, float P, float* O)
{
    VocoderState& state = VocoderState::Shared();
    std::lock_guard guard(state.Lock());
    OscillatorMemory& memory = state.oscillators;
    if (!memory.created)
        CreateOscillators(memory, N2, R, Nw, I, P);
    // A frame smaller than the first call's has no amplitudes for the upper
    // bins: they read as 0, which the gate (above 0) keeps silent.
    const int bins = memory.bins < N2 + 1 ? memory.bins : N2 + 1;
    for (int b = 0; b < bins; b++) {
        if (C[2 * b] >= synt)
            SoundBin(memory, C, b, I, O);
    }
}

}  // namespace glimmet
