#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "sound/BlockBuilder.h"
#include "sound/Channel.h"
#include "support/DiagnosticsCapture.h"
#include "support/Status.h"

namespace glimmet {
namespace {

using Samples = std::vector<int16_t>;

// A channel as one plain array, written straight from how a channel is meant
// to behave, case by case. Where the real array would be read past its end,
// the model reads silence.
struct ModelChannel {
    Samples data;
    bool hasData = false;
    int64_t first = 0;
    std::string printed;

    int64_t Count() const { return int64_t(data.size()); }
    int64_t End() const { return first + Count(); }
    int16_t At(int64_t index) const { return index >= 0 && index < Count() ? data[size_t(index)] : 0; }

    bool Fill(Samples& buffer, int64_t start, int64_t n)
    {
        const int64_t last = start + n - 1;
        if (start >= first && start < End()) {
            for (int64_t i = 0; i < n; i++)
                buffer[size_t(i)] = At(start - first + i);
        } else if (start >= first && start > End()) {
            std::fill(buffer.begin(), buffer.end(), 0);
        } else if (start == End()) {
            printed += "what the....?\n";
            return false;
        } else if (last <= first) {
            std::fill(buffer.begin(), buffer.end(), 0);
        } else {
            const int64_t gap = first - start;
            for (int64_t i = 0; i < n; i++)
                buffer[size_t(i)] = i < gap ? 0 : At(i - gap);
        }
        return true;
    }

    static Samples Part(const Samples& from, int64_t begin, int64_t end)
    {
        return Samples(from.begin() + begin, from.begin() + end);
    }

    static Samples Join(std::initializer_list<Samples> parts)
    {
        Samples all;
        for (const Samples& part : parts)
            all.insert(all.end(), part.begin(), part.end());
        return all;
    }

    status_t Insert(const Samples& frames, int64_t at)
    {
        if (frames.empty())
            return B_BAD_VALUE;
        if (!hasData) {
            data = frames;
            first = at;
            hasData = true;
        } else if (at >= first && at < End()) {
            data = Join({Part(data, 0, at - first), frames, Part(data, at - first, Count())});
        } else if (at >= End()) {
            data = Join({data, Samples(size_t(at - End()), 0), frames});
        } else {
            data = Join({frames, Samples(size_t(first - at), 0), data});
            first = at;
        }
        return B_OK;
    }

    status_t Replace(const Samples& frames, int64_t from, int64_t to)
    {
        if (frames.empty() || from > to || from < 0)
            return B_BAD_VALUE;
        if (!hasData) {
            data = frames;
            first = from;
            hasData = true;
        } else if (from >= first && from < End() && to < End()) {
            data = Join({Part(data, 0, from - first), frames, Part(data, to - first + 1, Count())});
        } else if (from >= first && from < End()) {
            printed += "  ending outside data\n";
            data = Join({Part(data, 0, from - first), frames});
        } else if (from >= End()) {
            data = Join({data, Samples(size_t(from - End()), 0), frames});
        } else if (to >= first && to < End()) {
            data = Join({frames, Part(data, to - first + 1, Count())});
            first = from;
        } else if (to >= End()) {
            data = frames;
            first = from;
        } else {
            data = Join({frames, Samples(size_t(first - to - 1), 0), data});
            first = from;
        }
        return B_OK;
    }

    status_t Remove(int64_t from, int64_t to)
    {
        if (from < 0 || from > to)
            return B_BAD_VALUE;
        if (from > End())
            return B_OK;
        to = std::min(to, End() - 1);
        if (first <= from) {
            data = Join({Part(data, 0, from - first), Part(data, std::max(to - first + 1, from - first), Count())});
            hasData = true;
        } else if (to >= first) {
            // The sample at `to` stays; the last one is lost.
            const int64_t length = Count() - (to - first + 1);
            data = Part(data, to - first, to - first + length);
            first = from;
            hasData = true;
        } else {
            first -= to - from + 1;
        }
        return B_OK;
    }
};

Samples SamplesOf(Channel& channel)
{
    Samples samples;
    channel.ReadSpans(0, channel.FrameCount(), [&samples](const SampleSpan& span) {
        samples.insert(samples.end(), span.samples, span.samples + span.count);
    });
    return samples;
}

Samples RandomSamples(std::mt19937& random, int64_t count)
{
    std::uniform_int_distribution<int> value(-32768, 32767);
    Samples samples(static_cast<size_t>(count));
    for (int16_t& sample : samples)
        sample = int16_t(value(random));
    return samples;
}

class Exercise {
public:
    explicit Exercise(uint32_t seed) : random_(seed) {}

    // A frame near one of the channel's edges, or anywhere around it.
    int64_t Frame()
    {
        const int64_t edges[] = {model_.first, model_.End(), 0, model_.first + BlockBuilder::kBlockSamples};
        std::uniform_int_distribution<int> pick(0, 5);
        const int choice = pick(random_);
        if (choice < 4) {
            std::uniform_int_distribution<int64_t> near(-3, 3);
            return edges[choice] + near(random_);
        }
        std::uniform_int_distribution<int64_t> anywhere(-20, model_.End() + 100);
        return anywhere(random_);
    }

    int64_t Length()
    {
        std::uniform_int_distribution<int> kind(0, 9);
        std::uniform_int_distribution<int64_t> small(-1, 40);
        std::uniform_int_distribution<int64_t> large(1, 3 * BlockBuilder::kBlockSamples);
        return kind(random_) < 7 ? small(random_) : large(random_);
    }

    void Step()
    {
        std::uniform_int_distribution<int> op(0, 7);
        // Long channels mostly shrink, so the run stays quick.
        const int choice = model_.Count() > 400000 ? 2 : op(random_);
        DiagnosticsCapture capture;
        model_.printed.clear();
        switch (choice) {
        case 0: Insert(); break;
        case 1: Replace(); break;
        case 2: Remove(); break;
        case 3: Fill(); break;
        case 4: {
            const int64_t first = Frame();
            channel_.SetStartFrameOffset(first);
            model_.first = std::max<int64_t>(first, 0);
            break;
        }
        case 5: ReplaceWithSlice(); break;
        case 6: InsertSlice(); break;
        default: Fill(); break;
        }
        ASSERT_EQ(capture.Finish(), model_.printed) << "step " << step_;
        Compare();
        step_++;
    }

    void Compare()
    {
        ASSERT_EQ(channel_.FirstFrame(), model_.first) << "step " << step_;
        ASSERT_EQ(channel_.FrameCount(), model_.Count()) << "step " << step_;
        ASSERT_TRUE(SamplesOf(channel_) == model_.data) << "step " << step_;
    }

private:
    void Insert()
    {
        const int64_t count = Length();
        const Samples frames = RandomSamples(random_, std::max<int64_t>(count, 0));
        const int64_t at = Frame();
        const status_t expected = model_.Insert(frames, at);
        ASSERT_EQ(channel_.InsertFrames(frames.empty() ? nullptr : frames.data(), count, at), expected);
    }

    void Replace()
    {
        const int64_t count = Length();
        const Samples frames = RandomSamples(random_, std::max<int64_t>(count, 0));
        const int64_t from = Frame();
        const int64_t to = Frame();
        const status_t expected = model_.Replace(frames, from, to);
        ASSERT_EQ(channel_.ReplaceFrames(frames.empty() ? nullptr : frames.data(), count, from, to), expected);
    }

    void Remove()
    {
        const int64_t from = Frame();
        const int64_t to = Frame();
        const status_t expected = model_.Remove(from, to);
        ASSERT_EQ(channel_.RemoveFrames(from, to), expected);
    }

    void Fill()
    {
        const int64_t start = Frame();
        const int64_t count = std::max<int64_t>(Length(), 1);
        Samples expected(size_t(count), 7);
        Samples actual(size_t(count), 7);
        const bool result = model_.Fill(expected, start, count);
        ASSERT_EQ(channel_.FillBuffer(actual.data(), start, count), result);
        ASSERT_EQ(actual, expected);
    }

    // A slice of the channel itself, read as FillBuffer would read it, put
    // somewhere else: the blocks it shares must not change under the edit.
    SampleSlice Slice(Samples* laidOut)
    {
        const int64_t start = Frame();
        const int64_t count = std::max<int64_t>(Length(), 1);
        laidOut->assign(size_t(count), 0);
        model_.Fill(*laidOut, start, count);
        SampleSlice slice;
        const status_t status = channel_.ReadSlice(start, count, &slice);
        EXPECT_NE(status, B_NO_MEMORY);
        EXPECT_EQ(slice.Count(), count);
        Samples copied(size_t(count), 5);
        slice.CopyTo(copied.data());
        EXPECT_EQ(copied, *laidOut);
        return slice;
    }

    void ReplaceWithSlice()
    {
        Samples frames;
        const SampleSlice slice = Slice(&frames);
        const int64_t from = Frame();
        const int64_t to = Frame();
        const status_t expected = model_.Replace(frames, from, to);
        ASSERT_EQ(channel_.ReplaceFrames(slice, from, to), expected);
    }

    void InsertSlice()
    {
        Samples frames;
        const SampleSlice slice = Slice(&frames);
        const int64_t at = Frame();
        const status_t expected = model_.Insert(frames, at);
        ASSERT_EQ(channel_.InsertFrames(slice, at), expected);
    }

    std::mt19937 random_;
    Channel channel_;
    ModelChannel model_;
    int step_ = 0;
};

TEST(BlockChannelTest, ThousandsOfEditsMatchAPlainArray)
{
    for (uint32_t seed : {1u, 2u, 3u, 4u}) {
        Exercise exercise(seed);
        for (int i = 0; i < 1500; i++) {
            ASSERT_NO_FATAL_FAILURE(exercise.Step()) << "seed " << seed;
            if (::testing::Test::HasFailure())
                return;
        }
    }
}

TEST(BlockChannelTest, ACutSharesEveryBlockAwayFromIt)
{
    Channel channel;
    std::mt19937 random(9);
    const Samples samples = RandomSamples(random, 40 * BlockBuilder::kBlockSamples);
    ASSERT_EQ(channel.InsertFrames(samples.data(), int64_t(samples.size()), 0), B_OK);
    std::vector<uint64_t> before;
    channel.ReadSpans(0, channel.FrameCount(), [&before](const SampleSpan& span) { before.push_back(span.block->Id()); });
    const int64_t middle = 20 * BlockBuilder::kBlockSamples + 1000;
    ASSERT_EQ(channel.RemoveFrames(middle, middle + 44099), B_OK);
    std::vector<uint64_t> after;
    channel.ReadSpans(0, channel.FrameCount(), [&after](const SampleSpan& span) { after.push_back(span.block->Id()); });
    size_t kept = 0;
    for (uint64_t id : after)
        kept += std::count(before.begin(), before.end(), id);
    // Only the blocks holding the cut's two ends are made anew.
    EXPECT_GE(kept, before.size() - 3);
    EXPECT_LE(after.size() - kept, 2u);
}

TEST(BlockChannelTest, TheMixerReadsEveryPieceOfARequestAcrossBlocks)
{
    Channel channel;
    std::mt19937 random(5);
    const Samples samples = RandomSamples(random, 3 * BlockBuilder::kBlockSamples);
    ASSERT_EQ(channel.InsertFrames(samples.data(), int64_t(samples.size()), 100), B_OK);
    const int64_t start = 100 + BlockBuilder::kBlockSamples - 10;
    Samples laidOut(BlockBuilder::kBlockSamples + 20, 0);
    int pieces = 0;
    bool sawFirst = false;
    bool sawLast = false;
    channel.ReadForMix(start, int64_t(laidOut.size()), [&](const Channel::MixSource& source) {
        ++pieces;
        sawFirst = sawFirst || source.firstPiece;
        sawLast = sawLast || source.lastPiece;
        std::copy_n(source.samples, source.length, laidOut.begin() + source.offset);
    });
    EXPECT_EQ(pieces, 3);
    EXPECT_TRUE(sawFirst);
    EXPECT_TRUE(sawLast);
    EXPECT_TRUE(std::equal(laidOut.begin(), laidOut.end(), samples.begin() + (start - 100)));
}

}  // namespace
}  // namespace glimmet
