#include "edit/vocoder/VocoderStretch.h"

#include <algorithm>
#include <cmath>
#include <mutex>

#include "edit/vocoder/Vocoder.h"
#include "support/Diagnostics.h"

namespace glimmet {

namespace {

using Floats = std::unique_ptr<float[], SpaceDeleter>;

constexpr int Nw = VocoderStretch::kWindow;
constexpr int64_t kSampleRate = 44100;
// The loop runs while more than three windows of input lie beyond pos.
constexpr int64_t kLookAhead = 3 * int64_t(Nw);

// A time for fold and overlapadd, brought into 0 .. N-1 beforehand: they
// only ever use it modulo N, and the running times may outgrow an int.
int TimeModulo(int64_t time, int N)
{
    const int64_t r = time % N;
    return int(r < 0 ? r + N : r);
}

// Everything one stretch works on; released when the run ends.
struct Work {
    int N;
    int N2;
    int D;
    int I;
    float P;
    Floats H, A, S, block, spareBlock, fft, previous, next, current, accumulator;
    int64_t tin = -int64_t(Nw);
    int64_t tout;
    int64_t pos = 0;
    float t = 0.0f;

    Work(int n, int d, int i, float p)
        : N(n), N2(n / 2), D(d), I(i), P(p), H(FloatSpace(Nw)), A(FloatSpace(Nw)), S(FloatSpace(Nw)),
          block(FloatSpace(Nw)), spareBlock(FloatSpace(Nw)), fft(FloatSpace(n)), previous(FloatSpace(n + 2)),
          next(FloatSpace(n + 2)), current(FloatSpace(n + 2)),
          // noscbank adds I values: a hop beyond the accumulator lands in
          // room that is never copied out.
          accumulator(FloatSpace(std::max(Nw, i))),
          tout(d != 0 ? -int64_t(Nw) * i / d : -int64_t(Nw))
    {
        makewindows(H.get(), A.get(), S.get(), Nw, N, I);
    }

    void Analyse(float* frame)
    {
        fold(block.get(), A.get(), Nw, fft.get(), N, TimeModulo(tin, N));
        rfft(fft.get(), N2, 1);
        convert(fft.get(), frame, N2, D, int(kSampleRate));
    }

    void LoadInput(const float* input, int64_t from)
    {
        std::copy(input + from, input + from + Nw, block.get());
    }

    // The block is refilled from the FFT buffer at pos, not from the input;
    // what lies beyond the buffer's N floats reads as 0.
    void LoadFromFft()
    {
        for (int64_t k = 0; k < Nw; k++)
            block[size_t(k)] = pos + k < N ? fft[size_t(pos + k)] : 0.0f;
    }

    void FirstFrames(const float* input)
    {
        LoadInput(input, pos);
        Analyse(previous.get());
        LoadInput(input, pos + Nw);
        Analyse(next.get());
        pos += 2 * Nw;
        tin += D;
        tout += I;
    }

    void AdvanceFrame()
    {
        while (t >= 1.0f)
            t -= 1.0f;
        VocoderStretch::CopyFrame(previous.get(), next.get(), N + 2);
        LoadFromFft();
        pos += Nw;
        Analyse(next.get());
        tin += D;
        tout += I;
    }

    void Synthesise()
    {
        if (P != 0.0f) {
            noscbank(current.get(), N2, int(kSampleRate), Nw, I, P, accumulator.get());
            return;
        }
        unconvert(current.get(), fft.get(), N2, I, int(kSampleRate));
        rfft(fft.get(), N2, 0);
        overlapadd(fft.get(), N, S.get(), accumulator.get(), Nw, TimeModulo(tout, N));
    }
};

bool IsPowerOfTwo(int32_t n)
{
    return n > 0 && (n & (n - 1)) == 0;
}

}  // namespace

bool VocoderStretch::UsableParameters(int32_t N, float stretch)
{
    if (!IsPowerOfTwo(N) || N < 2) {
        Diagnostics::PrintError("FFT length %d is not a power of two: nothing was stretched\n", int(N));
        return false;
    }
    // Frames are read 1 / stretch apart by repeatedly stepping t down by 1;
    // for a negative factor, or one so small that a float step of 1 no
    // longer changes t, the run would never end.
    const float step = 1.0f / stretch;
    if (!(stretch > 0.0f) || !(step < 16777216.0f)) {
        Diagnostics::PrintError("%g is not a stretch factor the vocoder can use\n", double(stretch));
        return false;
    }
    return true;
}

bool VocoderStretch::Stretch(const float* input, int64_t inputFrames, float* output, int64_t outputFrames,
    int32_t N, int32_t D, int32_t I, float P, float stretch, float, const std::atomic<bool>* stop,
    std::atomic<double>* progress)
{
    Diagnostics::Print("StretchAction::Stretch()\n");
    if (stretch == 0.0f) {
        Diagnostics::PrintError("0.0 not a legal stretch factor\n");
        return false;
    }
    if (!UsableParameters(N, stretch))
        return false;
    std::lock_guard guard(VocoderState::Shared().Lock());
    Work work(N, D, I == 0 ? D : I, P);
    const float step = float(1.0f / stretch);
    bool first = true;
    while (inputFrames > work.pos + kLookAhead) {
        if (stop != nullptr && stop->load())
            return false;
        if (progress != nullptr)
            progress->store(double(work.pos) / double(inputFrames - kLookAhead));
        if (first)
            work.FirstFrames(input);
        first = false;
        if (work.t >= 1.0f)
            work.AdvanceFrame();
        if (work.t == 0.0f)
            CopyFrame(work.current.get(), work.previous.get(), N + 2);
        else
            InterpolateFrame(work.current.get(), work.previous.get(), work.next.get(), N + 2, work.t);
        work.t += step;
        work.Synthesise();
        std::copy(work.accumulator.get(), work.accumulator.get() + std::min<int64_t>(Nw, outputFrames), output);
    }
    Diagnostics::PrintError("STRETCH DONE\n");
    return true;
}

void VocoderStretch::CopyFrame(float* dst, const float* src, int32_t n)
{
    for (int32_t k = 0; k < n; k++)
        dst[k] = src[k];
}

void VocoderStretch::InterpolateFrame(float* dst, const float* a, const float* b, int32_t n, float t)
{
    const float s = 1.0f - t;
    for (int32_t k = 0; k < n; k++)
        dst[k] = s * a[k] + t * b[k];
}

float VocoderStretch::MaxOf(const float* a, int32_t n)
{
    float largest = a[0];
    for (int32_t k = 1; k < n; k++)
        largest = std::max(largest, a[k]);
    return largest;
}

}  // namespace glimmet
