#pragma once

#include <cstdint>

namespace glimmet {

/// k * count / total, rounded down, for every row of a column.
///
/// A hardware division per pixel would cost more than counting the column's
/// samples from a summary. Dividends and divisors below 2^32 (every column
/// of a view up to a few thousand rows high) take one 64 x 64 -> 128-bit
/// multiply by a reciprocal that is exact for all such operands; anything
/// larger is estimated in double precision and then corrected to the exact
/// quotient.
class ColumnQuotients {
    __extension__ typedef unsigned __int128 Product;

public:
    explicit ColumnQuotients(int64_t total)
        : total_(total > 0 ? total : 1), reciprocal_(1.0 / double(total_)),
          // 2^64 / total rounded up; total 1 would need 2^64 and is the
          // dividend itself.
          multiplier_(total_ > 1 && total_ <= kNarrowLimit ? ~uint64_t(0) / uint64_t(total_) + 1 : 0)
    {
    }

    int64_t Of(int64_t dividend) const
    {
        if (multiplier_ != 0 && dividend >= 0 && dividend <= kNarrowLimit)
            return int64_t(uint64_t(Product(multiplier_) * uint64_t(dividend) >> 64));
        if (total_ == 1)
            return dividend;
        return Wide(dividend);
    }

    // k - k * count / total in byte arithmetic.
    uint8_t Fade(int64_t k, int64_t count) const { return uint8_t(k - Of(k * count)); }
    uint8_t Rise(int64_t k, int64_t count) const { return uint8_t(Of(k * count)); }

private:
    static constexpr int64_t kNarrowLimit = int64_t(0xffffffff);

    int64_t Wide(int64_t dividend) const
    {
        int64_t quotient = int64_t(double(dividend) * reciprocal_);
        while (quotient > 0 && quotient * total_ > dividend)
            --quotient;
        while ((quotient + 1) * total_ <= dividend)
            ++quotient;
        return quotient;
    }

    int64_t total_;
    double reciprocal_;
    uint64_t multiplier_;
};

}  // namespace glimmet
