#include <gtest/gtest.h>

#include <cstdint>
#include <random>

#include "views/ColumnQuotients.h"

namespace glimmet {
namespace {

// The shading of every pixel rests on these quotients being exact, so they
// are checked against the hardware division over the whole range they take:
// the narrow path up to 2^32 - 1 and the corrected estimate beyond it.
void ExpectExact(int64_t total, int64_t dividend)
{
    const ColumnQuotients quotients(total);
    ASSERT_EQ(quotients.Of(dividend), dividend / total) << dividend << " / " << total;
}

TEST(ColumnQuotients, AreExactAtTheEdgesOfTheNarrowRange)
{
    const int64_t edges[] = {1, 2, 3, 7, 255, 256, 65535, 65536, 82688, 2147483647, 2147483648, 4294967294,
                             4294967295, 4294967296, 4294967297, int64_t(1) << 40};
    for (int64_t total : edges) {
        for (int64_t dividend : edges) {
            ExpectExact(total, dividend);
            ExpectExact(total, dividend - 1);
        }
        ExpectExact(total, 0);
    }
}

TEST(ColumnQuotients, AreExactForRandomOperands)
{
    std::mt19937_64 random(20261123);
    for (int i = 0; i < 2000000; ++i) {
        const int shift = int(random() % 40);
        const int64_t total = int64_t(random() >> (24 + shift)) + 1;
        const int64_t dividend = int64_t(random() >> (20 + random() % 44));
        ExpectExact(total, dividend);
    }
}

TEST(ColumnQuotients, ExactMultiplesLandOnTheirQuotient)
{
    std::mt19937_64 random(7);
    for (int i = 0; i < 200000; ++i) {
        const int64_t total = int64_t(random() % 100000) + 1;
        const int64_t k = int64_t(random() % 256);
        const int64_t dividend = k * total;
        ExpectExact(total, dividend);
        ExpectExact(total, dividend + total - 1);
        if (dividend > 0)
            ExpectExact(total, dividend - 1);
    }
}

TEST(ColumnQuotients, FadeAndRiseAreTheByteShades)
{
    const ColumnQuotients quotients(82688);
    EXPECT_EQ(quotients.Fade(245, 0), 245);
    EXPECT_EQ(quotients.Fade(245, 82688), 0);
    EXPECT_EQ(quotients.Rise(255, 82688), 255);
    EXPECT_EQ(quotients.Rise(255, 41344), 127);
    EXPECT_EQ(quotients.Fade(45, 41344), 23);
}

}  // namespace
}  // namespace glimmet
