#include <gtest/gtest.h>

#include <cstdint>
#include <tuple>
#include <vector>

#include "files/FrameSpreader.h"

namespace glimmet {
namespace {

constexpr int16_t kGuard = 0x5a5a;

std::vector<int16_t> Interleaved(int64_t samples)
{
    std::vector<int16_t> values(size_t(samples) + 1);
    uint32_t state = 12345;
    for (int16_t& value : values) {
        state = state * 1664525u + 1013904223u;
        value = int16_t(state >> 16);
    }
    return values;
}

/// Frame counts around the vector width and beyond, and the offsets (in
/// samples) of the destinations and of the source from an aligned start.
class FrameSpreaderTest : public ::testing::TestWithParam<std::tuple<int64_t, int, int, int>> {};

TEST_P(FrameSpreaderTest, StereoMatchesThePlainLoopAndStaysInBounds)
{
    const auto [frames, leftOffset, rightOffset, sourceOffset] = GetParam();
    const std::vector<int16_t> source = Interleaved(2 * frames + sourceOffset);
    std::vector<int16_t> left(size_t(frames + 32), kGuard);
    std::vector<int16_t> right(size_t(frames + 32), kGuard);
    FrameSpreader::SpreadStereo(source.data() + sourceOffset, frames, left.data() + leftOffset,
                                right.data() + rightOffset);
    FrameSpreader::Finish();
    for (int64_t i = 0; i < int64_t(left.size()); ++i) {
        const bool inLeft = i >= leftOffset && i < leftOffset + frames;
        const bool inRight = i >= rightOffset && i < rightOffset + frames;
        ASSERT_EQ(left[size_t(i)], inLeft ? source[size_t(sourceOffset + 2 * (i - leftOffset))] : kGuard) << i;
        ASSERT_EQ(right[size_t(i)], inRight ? source[size_t(sourceOffset + 2 * (i - rightOffset) + 1)] : kGuard)
            << i;
    }
}

TEST_P(FrameSpreaderTest, MonoMatchesACopyAndStaysInBounds)
{
    const auto [frames, offset, unused, sourceOffset] = GetParam();
    (void)unused;
    const std::vector<int16_t> source = Interleaved(frames + sourceOffset);
    std::vector<int16_t> to(size_t(frames + 32), kGuard);
    FrameSpreader::SpreadMono(source.data() + sourceOffset, frames, to.data() + offset);
    FrameSpreader::Finish();
    for (int64_t i = 0; i < int64_t(to.size()); ++i) {
        const bool inside = i >= offset && i < offset + frames;
        ASSERT_EQ(to[size_t(i)], inside ? source[size_t(sourceOffset + i - offset)] : kGuard) << i;
    }
}

INSTANTIATE_TEST_SUITE_P(SizesAndAlignments, FrameSpreaderTest,
                         ::testing::Combine(::testing::Values(0, 1, 3, 7, 8, 9, 15, 16, 17, 31, 1000, 4097),
                                            ::testing::Values(0, 1, 3, 7, 8), ::testing::Values(0, 1, 8),
                                            ::testing::Values(0, 1)));

TEST(FrameSpreaderNullTest, StereoSkipsAMissingSide)
{
    const std::vector<int16_t> source = Interleaved(2 * 100);
    std::vector<int16_t> left(100, kGuard);
    std::vector<int16_t> right(100, kGuard);
    FrameSpreader::SpreadStereo(source.data(), 100, nullptr, right.data());
    FrameSpreader::SpreadStereo(source.data(), 100, left.data(), nullptr);
    FrameSpreader::SpreadStereo(source.data(), 100, nullptr, nullptr);
    FrameSpreader::Finish();
    for (size_t i = 0; i < 100; ++i) {
        ASSERT_EQ(left[i], source[2 * i]);
        ASSERT_EQ(right[i], source[2 * i + 1]);
    }
}

}  // namespace
}  // namespace glimmet
