#pragma once

namespace glimmet {

/// Builds three windows of Nw floats: the Hamming window H, the analysis
/// window A and the synthesis window S. When the window is longer than the
/// FFT (Nw > N) A and S are shaped by sinc interpolation for N and I.
void makewindows(float* H, float* A, float* S, int Nw, int N, int I);

/// Windows the Nw floats of I with W and folds them, time-aliased, into the
/// N floats of O, rotated so that input time n lands at index 0.
void fold(float* I, float* W, int Nw, float* O, int N, int n);

/// The inverse of fold: unrotates the N floats of I for output time n,
/// windows them with W and adds them into the Nw floats of O.
void overlapadd(float* I, int N, float* W, float* O, int Nw, int n);

}  // namespace glimmet
