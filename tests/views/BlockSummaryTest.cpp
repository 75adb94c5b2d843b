#include <gtest/gtest.h>

#include <array>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "sound/SampleBlock.h"
#include "views/BlockSummary.h"
#include "views/RowCounter.h"

namespace glimmet::test {
namespace {

using RowTable = std::array<int16_t, 8192>;

RowTable TableFor(int rows)
{
    RowTable table{};
    const uint32_t divisor = 65535u / uint32_t(rows) + 1;
    for (uint32_t i = 0; i < table.size(); ++i)
        table[i] = int16_t((8 * i) / divisor);
    return table;
}

std::shared_ptr<SampleBlock> NoiseBlock(int64_t count, uint32_t seed, int amplitude = 32768)
{
    std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(count);
    std::mt19937 random(seed);
    for (int64_t i = 0; i < count; ++i)
        block->MutableSamples()[i] = int16_t(int(random() % uint32_t(2 * amplitude)) - amplitude);
    return block;
}

/// Row counts of from..to - 1 of the block, counted one sample at a time.
std::vector<uint16_t> CountedByHand(const SampleBlock& block, const RowTable& table, int slots, int64_t from, int64_t to)
{
    std::vector<uint16_t> counts(size_t(slots), 0);
    for (int64_t i = from; i < to; ++i) {
        const int row = std::min<int>(table[size_t((block.Samples()[i] + 32768) >> 3)], slots - 1);
        ++counts[size_t(row)];
    }
    return counts;
}

std::vector<uint16_t> Counted(RowCounter& counter, const SampleSpan& span, int slots, int64_t from, int64_t to)
{
    std::vector<uint16_t> counts(size_t(slots), 0);
    counter.Clear();
    counter.Add(span, from, to);
    counter.Finish(counts.data());
    return counts;
}

/// Every row of the summary's whole chunks, for a 200-row view, holds what
/// counting those samples one at a time gives.
void ExpectWholeChunksAsByHand(const SampleBlock& block, const RowTable& table, const std::string& context)
{
    const auto summary = BlockSummary::Make(block.Samples(), block.Count(), table.data(), 1);
    ASSERT_NE(summary, nullptr) << context;
    const int64_t summarised = summary->CountChunks() * summary->ChunkSize();
    std::vector<uint32_t> counts(200, 0);
    summary->AddChunks(counts.data(), 199, 0, summary->CountChunks());
    const std::vector<uint16_t> expected = CountedByHand(block, table, 200, 0, summarised);
    for (size_t row = 0; row < counts.size(); ++row)
        ASSERT_EQ(uint16_t(counts[row]), expected[row]) << context << " row " << row;
}

TEST(BlockSummary, StaysWithinAQuarterOfItsBlock)
{
    for (int rows : {1, 15, 200, 2001}) {
        for (int amplitude : {3, 400, 32768}) {
            const auto block = NoiseBlock(65536, uint32_t(rows + amplitude), amplitude);
            const RowTable table = TableFor(rows);
            const auto summary = BlockSummary::Make(block->Samples(), block->Count(), table.data(), 1);
            ASSERT_NE(summary, nullptr);
            EXPECT_LE(summary->Bytes(), size_t(block->Count()) * sizeof(int16_t) / 4) << rows << " " << amplitude;
        }
    }
}

TEST(BlockSummary, QuietBlocksGetFinerChunksThanLoudOnes)
{
    const RowTable table = TableFor(200);
    const auto quiet = NoiseBlock(65536, 1, 300);
    const auto loud = NoiseBlock(65536, 2);
    const auto quietSummary = BlockSummary::Make(quiet->Samples(), quiet->Count(), table.data(), 1);
    const auto loudSummary = BlockSummary::Make(loud->Samples(), loud->Count(), table.data(), 1);
    EXPECT_LT(quietSummary->ChunkSize(), loudSummary->ChunkSize());
}

// The block's extremes decide which rows the summary keeps; a loud sample
// anywhere, at the start, between two vectors' worth of samples or in the
// last few, must still be counted in its own row.
TEST(BlockSummary, ALoneLoudSampleAnywhereIsCountedInItsRow)
{
    const RowTable table = TableFor(200);
    for (int64_t count : {int64_t(256), int64_t(272), int64_t(300), int64_t(1039)}) {
        for (int64_t position : {int64_t(0), int64_t(1), int64_t(15), int64_t(16), int64_t(17), count / 2, count - 17,
                 int64_t(255), count - 1}) {
            for (int16_t loud : {int16_t(32767), int16_t(-32768)}) {
                std::shared_ptr<SampleBlock> block = NoiseBlock(count, uint32_t(count + position), 100);
                block->MutableSamples()[position] = loud;
                ExpectWholeChunksAsByHand(*block, table,
                    std::to_string(count) + " " + std::to_string(position) + " " + std::to_string(loud));
            }
        }
    }
}

// The views build tables whose rows grow with the sample, but a summary
// takes any table: the rows it keeps are those of every entry its samples
// can reach, wherever in that stretch the lowest and highest rows lie.
TEST(BlockSummary, AScrambledTableIsCountedAsByHand)
{
    RowTable table{};
    std::mt19937 random(7);
    for (int16_t& row : table)
        row = int16_t(random() % 200u);
    for (int amplitude : {5, 120, 3000, 32768}) {
        const auto block = NoiseBlock(4096 + 12, uint32_t(amplitude), amplitude);
        ExpectWholeChunksAsByHand(*block, table, "amplitude " + std::to_string(amplitude));
    }
}

TEST(BlockSummary, RefusesBlocksOutsideItsLimits)
{
    const RowTable table = TableFor(100);
    int16_t sample = 0;
    EXPECT_EQ(BlockSummary::Make(&sample, 0, table.data(), 1), nullptr);
    EXPECT_EQ(BlockSummary::Make(nullptr, 10, table.data(), 1), nullptr);
    EXPECT_EQ(BlockSummary::Make(&sample, (int64_t(1) << 24) + 1, table.data(), 1), nullptr);
}

TEST(BlockSummary, DifferentTablesHaveDifferentKeys)
{
    const RowTable a = TableFor(100);
    const RowTable b = TableFor(101);
    EXPECT_EQ(BlockSummary::KeyOf(a.data()), BlockSummary::KeyOf(TableFor(100).data()));
    EXPECT_NE(BlockSummary::KeyOf(a.data()), BlockSummary::KeyOf(b.data()));
}

// Whole chunks come from the summary: once it is made, changing the samples
// under it (which a shared block never does) shows in the counts only
// outside the whole chunks.
TEST(RowCounter, WholeChunksAreTakenFromTheSummary)
{
    const auto block = NoiseBlock(65536, 9);
    const RowTable table = TableFor(50);
    RowCounter counter(table.data(), 51);
    const SampleSpan span{block->Samples(), block->Count(), block.get(), 0};
    const auto before = Counted(counter, span, 51, 0, 65536);
    ASSERT_EQ(counter.SummariesMade(), 1);
    ASSERT_NE(block->Summary(), nullptr);
    EXPECT_EQ(before, CountedByHand(*block, table, 51, 0, 65536));
    std::fill(block->MutableSamples(), block->MutableSamples() + 65536, int16_t(-32768));
    const auto after = Counted(counter, span, 51, 0, 65536);
    EXPECT_EQ(after, before);
    EXPECT_NE(after, CountedByHand(*block, table, 51, 0, 65536));
}

TEST(RowCounter, PartsOfBlocksMatchCountingByHand)
{
    const auto block = NoiseBlock(65536, 4);
    std::mt19937 random(5);
    for (int rows : {1, 2, 37, 200, 1000}) {
        const RowTable table = TableFor(rows);
        // Fewer slots than rows too: the rows past the last are clamped.
        for (int slots : {rows + 1, std::max(rows / 2, 1)}) {
            RowCounter counter(table.data(), uint32_t(slots));
            const SampleSpan span{block->Samples() + 100, 60000, block.get(), 100};
            for (int i = 0; i < 200; ++i) {
                const int64_t from = int64_t(random() % 60000);
                const int64_t to = from + int64_t(random() % uint32_t(60000 - from + 1));
                ASSERT_EQ(Counted(counter, span, slots, from, to), CountedByHand(*block, table, slots, 100 + from, 100 + to))
                    << rows << " rows, " << slots << " slots, " << from << ".." << to;
            }
        }
    }
}

TEST(RowCounter, AnotherHeightMakesANewSummary)
{
    const auto block = NoiseBlock(40000, 6);
    const SampleSpan span{block->Samples(), block->Count(), block.get(), 0};
    const RowTable small = TableFor(30);
    const RowTable tall = TableFor(300);
    RowCounter first(small.data(), 31);
    Counted(first, span, 31, 0, 40000);
    const auto summary = block->Summary();
    RowCounter second(tall.data(), 301);
    EXPECT_EQ(Counted(second, span, 301, 0, 40000), CountedByHand(*block, tall, 301, 0, 40000));
    EXPECT_EQ(second.SummariesMade(), 1);
    EXPECT_NE(block->Summary(), summary);
}

// A column reading less than half a block leaves it without a summary:
// zoomed-in views read few samples and need none.
TEST(RowCounter, ShortReadsMakeNoSummary)
{
    const auto block = NoiseBlock(65536, 7);
    const RowTable table = TableFor(100);
    RowCounter counter(table.data(), 101);
    const SampleSpan span{block->Samples(), block->Count(), block.get(), 0};
    for (int64_t from = 0; from + 30000 <= 65536; from += 1000)
        EXPECT_EQ(Counted(counter, span, 101, from, from + 30000), CountedByHand(*block, table, 101, from, from + 30000));
    EXPECT_EQ(counter.SummariesMade(), 0);
    EXPECT_EQ(block->Summary(), nullptr);
}

// A span whose numbers do not fit its block is read as plain samples and
// never through the block.
TEST(RowCounter, ASpanOutsideItsBlockIsReadAsSamples)
{
    const auto block = NoiseBlock(1000, 8);
    const auto other = NoiseBlock(5000, 9);
    const RowTable table = TableFor(20);
    RowCounter counter(table.data(), 21);
    const SampleSpan span{other->Samples(), 5000, block.get(), 0};
    EXPECT_EQ(Counted(counter, span, 21, 0, 5000), CountedByHand(*other, table, 21, 0, 5000));
    EXPECT_EQ(block->Summary(), nullptr);
}

}  // namespace
}  // namespace glimmet::test
