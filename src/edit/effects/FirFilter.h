#pragma once

#include <concepts>
#include <cstdint>
#include <span>
#include <vector>

namespace glimmet::effects {

/// The sample arithmetic of the FIR filter, free of any document: the action
/// builds the kernel once from the user's curve, keeps it for redo, and runs
/// the filter over each selected channel's range.

/// The coefficients drawn by the curve: kernel[i] = 1 - curve(i / taps), the
/// position in double, so the curve is sampled over [0, 1) and its right end
/// is never reached. The coefficients are used as drawn, without
/// normalisation. A tap count of 0 or less gives an empty kernel, which
/// leaves the samples unchanged (see FirFilter).
template <std::invocable<double> Curve>
std::vector<double> FirKernel(Curve&& curve, int32_t taps)
{
    std::vector<double> kernel;
    if (taps <= 0) {
        return kernel;
    }
    kernel.reserve(size_t(taps));
    for (int32_t i = 0; i < taps; ++i) {
        const double value = curve(double(i) / double(taps));
        kernel.push_back(1.0 - value);
    }
    return kernel;
}

/// Filters output.size() frames causally. input holds kernel.size() frames of
/// history (the frames just before the range, oldest first) followed by the
/// frames of the range, so input.size() must be output.size() +
/// kernel.size(); otherwise std::invalid_argument is thrown. input and output
/// must not overlap.
///
/// With x the current frame and h[k] the frame k frames before it:
///   acc = trunc(kernel[0] * x)
///   for k = 1 .. taps - 1: acc = clamp(acc + trunc(kernel[k] * h[k]))
/// where clamp limits to [-32768, 32767]. The running sum is clamped after
/// every term, so an intermediate overflow saturates and later terms start
/// from the clamped value. Products are taken in double and truncated toward
/// zero to an int32 (INT32_MIN when out of range or not a number); the int32
/// sum wraps in two's complement, which only huge coefficients reach.
///
/// Fewer than two taps, where the per-term loop has nothing to add:
/// - one tap is a plain gain, output = clamp(trunc(kernel[0] * x));
/// - no taps (a tap count of 0 or less, or no kernel at all) copies the range
///   unchanged.
void FirFilter(std::span<const int16_t> input, std::span<const double> kernel,
               std::span<int16_t> output);

/// FirFilter without the copies: samples is the range, filtered where it is,
/// and history the kernel.size() frames before it, oldest first (otherwise
/// std::invalid_argument is thrown). The samples become what FirFilter gives
/// for the input history followed by the samples.
void FirFilterInPlace(std::span<const int16_t> history, std::span<const double> kernel,
                      std::span<int16_t> samples);

}  // namespace glimmet::effects
