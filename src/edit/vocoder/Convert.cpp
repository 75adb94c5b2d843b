#include "edit/vocoder/Convert.h"

#include <algorithm>
#include <cmath>
#include <mutex>

#include "edit/vocoder/VocoderConstants.h"
#include "edit/vocoder/VocoderState.h"

namespace glimmet {

namespace {

// The phase memory of unconvert is never smaller than 8192 bytes.
constexpr int kMinimumPhases = 8192 / int(sizeof(float));

void CreateConvert(ConvertMemory& memory, int N2, int D, int R)
{
    memory.lastPhase.Allocate(N2 + 1);
    memory.fundamental = float(R) / float(N2 << 1);
    memory.factor = float(R / (kVocoderTwoPi * D));
    memory.created = true;
}

void CreateUnconvert(UnconvertMemory& memory, int N2, int I, int R)
{
    memory.phase.Allocate(std::max(N2 + 1, kMinimumPhases));
    memory.fundamental = float(R) / float(N2 << 1);
    memory.factor = float(I * kVocoderTwoPi / R);
    memory.created = true;
}

// The phase step brought into -pi .. pi.
float Unwrapped(float d)
{
    while (d > kVocoderPi)
        d = float(d - kVocoderTwoPi);
    while (d < -kVocoderPi)
        d = float(d + kVocoderTwoPi);
    return d;
}

}  // namespace

void convert(float* S, float* C, int N2, int D, int R)
{
    VocoderState& state = VocoderState::Shared();
    std::lock_guard guard(state.Lock());
    ConvertMemory& memory = state.convert;
    if (!memory.created)
        CreateConvert(memory, N2, D, R);
    for (int i = 0; i <= N2; i++) {
        const float real = i == N2 ? S[1] : S[2 * i];
        const float imag = (i == 0 || i == N2) ? 0.0f : S[2 * i + 1];
        const float a = float(std::hypot(double(real), double(imag)));
        C[2 * i] = a;
        float d = 0.0f;
        if (a != 0.0f) {
            const float phase = float(-std::atan2(double(imag), double(real)));
            d = phase - memory.lastPhase[i];
            memory.lastPhase[i] = phase;
            d = Unwrapped(d);
        }
        C[2 * i + 1] = float(i) * memory.fundamental + d * memory.factor;
    }
}

void unconvert(float* C, float* S, int N2, int I, int R)
{
    VocoderState& state = VocoderState::Shared();
    std::lock_guard guard(state.Lock());
    UnconvertMemory& memory = state.unconvert;
    if (!memory.created)
        CreateUnconvert(memory, N2, I, R);
    for (int i = 0; i <= N2; i++) {
        const float a = C[2 * i];
        float& phase = memory.phase[i];
        phase += C[2 * i + 1] - memory.fundamental * float(i);
        const float phi = phase * memory.factor;
        const float real = float(a * std::cos(double(phi)));
        if (i == N2) {
            S[1] = real;
        } else {
            S[2 * i] = real;
            S[2 * i + 1] = float(-a * std::sin(double(phi)));
        }
    }
}

}  // namespace glimmet
