#pragma once

namespace glimmet {

/// Turns the spectrum S (N2 complex values, packed as rfft leaves them) into
/// the frame C of N2 + 1 (amplitude, frequency in Hz) pairs, for an
/// analysis hop of D samples at R Hz. Keeps each bin's phase for the next
/// call; the first call's N2, D and R hold for the rest of the run.
void convert(float* S, float* C, int N2, int D, int R);

/// The inverse of convert for a synthesis hop of I samples: accumulates
/// each bin's phase and writes the spectrum S. The first call's N2, I and R
/// hold for the rest of the run.
void unconvert(float* C, float* S, int N2, int I, int R);

}  // namespace glimmet
