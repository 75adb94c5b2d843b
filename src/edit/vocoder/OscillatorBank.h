#pragma once

namespace glimmet {

/// The amplitude below which noscbank leaves a bin silent (initially 1e-8).
extern float synt;

/// Oscillator-bank resynthesis of one hop: adds I samples of a sum of
/// table-lookup cosine oscillators, one per bin of the frame C, to O. Each
/// bin's amplitude and frequency glide linearly from the previous call's
/// values; frequencies are scaled by the pitch factor P, and with P > 1 only
/// the bins that stay below the Nyquist frequency sound. The frequencies in
/// C are rewritten as table increments. The first call's N2, R, Nw, I and P
/// hold for the rest of the run.
void noscbank(float* C, int N2, int R, int Nw, int I, float P, float* O);

}  // namespace glimmet
