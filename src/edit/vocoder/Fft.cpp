#include "edit/vocoder/Fft.h"

#include <cmath>
#include <mutex>
#include <utility>

#include "edit/vocoder/VocoderConstants.h"
#include "edit/vocoder/VocoderState.h"

namespace glimmet {

namespace {

// The twiddle factors advance by the recurrence w += w * (wpr + i wpi), in
// double, from w = 1.
struct Twiddle {
    double wr = 1.0;
    double wi = 0.0;
    double wpr;
    double wpi;

    explicit Twiddle(double theta)
    {
        const double half = std::sin(0.5 * theta);
        wpr = -2.0 * half * half;
        wpi = std::sin(theta);
    }

    void Advance()
    {
        const double old = wr;
        wr += wr * wpr - wi * wpi;
        wi += wi * wpr + old * wpi;
    }
};

void Butterflies(float* x, int ND, int forward)
{
    for (int mmax = 2; mmax < ND; mmax *= 2) {
        const int delta = 2 * mmax;
        Twiddle w(kVocoderTwoPi / (forward ? mmax : -mmax));
        for (int m = 0; m < mmax; m += 2) {
            for (int i = m; i < ND; i += delta) {
                const int j = i + mmax;
                const float tr = float(w.wr * x[j] - w.wi * x[j + 1]);
                const float ti = float(w.wr * x[j + 1] + w.wi * x[j]);
                x[j] = x[i] - tr;
                x[j + 1] = x[i + 1] - ti;
                x[i] += tr;
                x[i + 1] += ti;
            }
            w.Advance();
        }
    }
}

// One pair of the real transform's untangling: a and b are the real and
// imaginary parts at the mirrored index 2N - i1.
void Untangle(float* x, int i1, float& a, float& b, float c1, float c2, const Twiddle& w)
{
    const int i2 = i1 + 1;
    const float h1r = c1 * (x[i1] + a);
    const float h1i = c1 * (x[i2] - b);
    const float h2r = -c2 * (x[i2] + b);
    const float h2i = c2 * (x[i1] - a);
    x[i1] = float(h1r + w.wr * h2r - w.wi * h2i);
    x[i2] = float(h1i + w.wr * h2i + w.wi * h2r);
    a = float(h1r - w.wr * h2r + w.wi * h2i);
    b = float(-h1i + w.wr * h2i + w.wi * h2r);
}

}  // namespace

void bitreverse(float* x, int N)
{
    for (int j = 0, m = 0; j < N; j += 2) {
        // A length that is not a power of two can push m past the end; such
        // a pair is left alone.
        if (j < m && m + 1 < N) {
            std::swap(x[j], x[m]);
            std::swap(x[j + 1], x[m + 1]);
        }
        int step = N >> 1;
        while (step >= 2 && m >= step) {
            m -= step;
            step >>= 1;
        }
        m += step;
    }
}

void cfft(float* x, int NC, int forward)
{
    const int ND = NC << 1;
    bitreverse(x, ND);
    Butterflies(x, ND, forward);
    const double scale = forward ? 1.0 / ND : 2.0;
    for (int i = 0; i < ND; i++)
        x[i] = float(x[i] * scale);
}

void rfft(float* x, int N, int forward)
{
    {
        // Only remembers that it has run; nothing depends on it.
        VocoderState& state = VocoderState::Shared();
        std::lock_guard guard(state.Lock());
        state.rfftCalled = true;
    }
    double theta = kVocoderPi / N;
    const float c1 = 0.5f;
    float c2;
    float xr;
    float xi;
    if (forward) {
        c2 = -0.5f;
        cfft(x, N, forward);
        xr = x[0];
        xi = x[1];
    } else {
        c2 = 0.5f;
        theta = -theta;
        xr = x[1];
        xi = 0.0f;
        x[1] = 0.0f;
    }
    Twiddle w(theta);
    for (int i = 0; i <= N / 2; i++) {
        const int i1 = i << 1;
        const int i3 = 2 * N + 1 - (i1 + 1);
        if (i == 0)
            Untangle(x, i1, xr, xi, c1, c2, w);
        else
            Untangle(x, i1, x[i3], x[i3 + 1], c1, c2, w);
        w.Advance();
    }
    if (forward)
        x[1] = xr;
    else
        cfft(x, N, 0);
}

}  // namespace glimmet
