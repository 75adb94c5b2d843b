#pragma once

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <vector>

namespace glimmet::test {

/// The transforms' arithmetic written out again, independently of the
/// production code, as the tests' reference: double precision, truncation
/// toward zero, the low 16 bits kept, not-a-number stored as 0.
struct TransformReference {
    static int16_t Low16(double value)
    {
        if (std::isnan(value) || std::isinf(value) || std::fabs(value) >= 2147483648.0)
            return 0;
        const int64_t truncated = int64_t(std::trunc(value));
        return int16_t(uint16_t(uint64_t(truncated) & 0xffffu));
    }

    static double Quotient(double numerator, double denominator)
    {
        if (denominator == 0.0) {
            if (numerator == 0.0 || std::isnan(numerator))
                return std::numeric_limits<double>::quiet_NaN();
            return std::copysign(std::numeric_limits<double>::infinity(), numerator);
        }
        return numerator / denominator;
    }

    static std::vector<int16_t> FadeIn(std::vector<int16_t> s)
    {
        const int64_t n = int64_t(s.size());
        for (int64_t i = 0; i < n; i++)
            s[size_t(i)] = Low16(Quotient(double(i) * double(s[size_t(i)]), double(n - 1)));
        return s;
    }

    static std::vector<int16_t> FadeOut(std::vector<int16_t> s)
    {
        const int64_t n = int64_t(s.size());
        for (int64_t i = 0; i < n; i++) {
            const double gain = 1.0 - Quotient(double(i), double(n - 1));
            s[size_t(i)] = Low16(gain * double(s[size_t(i)]));
        }
        return s;
    }

    static std::vector<int16_t> Revert(const std::vector<int16_t>& s)
    {
        return std::vector<int16_t>(s.rbegin(), s.rend());
    }

    static std::vector<int16_t> RevertPhases(std::vector<int16_t> s)
    {
        for (int16_t& sample : s)
            sample = sample == -32768 ? int16_t(-32768) : int16_t(-sample);
        return s;
    }

    /// Maximize over the ranges of all selected channels together.
    static void Maximize(std::vector<std::vector<int16_t>>& ranges)
    {
        int16_t peak = 0;
        for (const auto& range : ranges) {
            for (int16_t sample : range) {
                if (std::abs(int(sample)) > std::abs(int(peak)))
                    peak = sample;
            }
        }
        if (std::abs(int(peak)) > 32766)
            return;
        const float factor = peak == 0 ? std::numeric_limits<float>::infinity()
                                       : std::fabs(32767.0f / float(peak));
        for (auto& range : ranges) {
            for (int16_t& sample : range)
                sample = Low16(double(factor) * double(sample));
        }
    }
};

}  // namespace glimmet::test
