#pragma once

namespace glimmet {

/// Puts the N/2 complex values held in the N floats of x in bit-reversed
/// order.
void bitreverse(float* x, int N);

/// Complex FFT in place of the NC complex values of x (2 NC floats). The
/// forward transform uses the kernel e^{+i theta} and scales by 1 / (2 NC);
/// the inverse uses e^{-i theta} and scales by 2.
void cfft(float* x, int NC, int forward);

/// Real FFT in place of the 2N real samples of x. The spectrum is packed as
/// N complex values, with the real parts of DC in x[0] and of the Nyquist
/// bin in x[1].
void rfft(float* x, int N, int forward);

}  // namespace glimmet
