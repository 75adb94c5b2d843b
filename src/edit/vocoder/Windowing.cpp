#include "edit/vocoder/Windowing.h"

#include <cmath>

#include "edit/vocoder/VocoderConstants.h"

namespace glimmet {

namespace {

void Hamming(float* H, float* A, float* S, int Nw)
{
    for (int i = 0; i < Nw; i++)
        H[i] = A[i] = S[i] = float(0.54 - 0.46 * std::cos(kVocoderTwoPi * i / (Nw - 1)));
}

// Both windows are multiplied by sinc functions centred on the window.
void ApplySinc(float* A, float* S, int Nw, int N, int I)
{
    float x = -(Nw - 1) / 2.0f;
    for (int i = 0; i < Nw; i++, x += 1.0f) {
        if (x == 0.0f)
            continue;
        A[i] = float(A[i] * (N * std::sin(kVocoderPi * x / N) / (kVocoderPi * x)));
        if (I != 0)
            S[i] = float(S[i] * (I * std::sin(kVocoderPi * x / I) / (kVocoderPi * x)));
    }
}

// A hop that is not positive contributes only the sample at 0: every later
// index lies before the window, where there is nothing to add.
void NormaliseForHop(float* S, int Nw, int I)
{
    float sum = 0.0f;
    for (int i = 0; i < Nw; i += I) {
        sum += S[i] * S[i];
        if (I < 0)
            break;
    }
    const float inverse = 1.0f / sum;
    for (int i = 0; i < Nw; i++)
        S[i] *= inverse;
}

int Wrap(int n, int N)
{
    while (n < 0)
        n += N;
    return n % N;
}

}  // namespace

void makewindows(float* H, float* A, float* S, int Nw, int N, int I)
{
    Hamming(H, A, S, Nw);
    if (Nw > N)
        ApplySinc(A, S, Nw, N, I);
    float sum = 0.0f;
    for (int i = 0; i < Nw; i++)
        sum += A[i];
    const float afac = 2.0f / sum;
    const float sfac = Nw > N ? 1.0f / afac : afac;
    for (int i = 0; i < Nw; i++) {
        A[i] *= afac;
        S[i] *= sfac;
    }
    if (Nw <= N && I != 0)
        NormaliseForHop(S, Nw, I);
}

void fold(float* I, float* W, int Nw, float* O, int N, int n)
{
    if (N < 1)
        return;
    for (int i = 0; i < N; i++)
        O[i] = 0.0f;
    n = Wrap(n, N);
    for (int i = 0; i < Nw; i++) {
        O[n] += I[i] * W[i];
        if (++n == N)
            n = 0;
    }
}

void overlapadd(float* I, int N, float* W, float* O, int Nw, int n)
{
    if (N < 1)
        return;
    n = Wrap(n, N);
    for (int i = 0; i < Nw; i++) {
        O[i] += I[n] * W[i];
        if (++n == N)
            n = 0;
    }
}

}  // namespace glimmet
