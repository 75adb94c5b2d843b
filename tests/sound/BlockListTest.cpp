// The block list against a plain list of blocks: positions, starts, lookups
// and spans agree whatever runs the references were gathered in, and a list
// built from another shares its runs instead of its blocks' counts.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <vector>

#include "sound/BlockBuilder.h"
#include "sound/BlockList.h"

namespace glimmet {
namespace {

BlockRef SmallBlock(std::mt19937& random)
{
    std::vector<int16_t> samples(1 + random() % 40);
    for (int16_t& sample : samples)
        sample = int16_t(random());
    return SampleBlock::CopyOf(samples.data(), int64_t(samples.size()));
}

// What the list must look like from outside.
struct PlainList {
    std::vector<BlockRef> blocks;

    int64_t Count() const
    {
        int64_t count = 0;
        for (const BlockRef& block : blocks)
            count += block->Count();
        return count;
    }
};

void ExpectSame(const BlockList& list, const PlainList& plain)
{
    ASSERT_EQ(list.BlockCount(), plain.blocks.size());
    ASSERT_EQ(list.Count(), plain.Count());
    int64_t start = 0;
    std::vector<int16_t> flat;
    for (size_t i = 0; i < plain.blocks.size(); ++i) {
        ASSERT_EQ(list.BlockAt(i).get(), plain.blocks[i].get()) << i;
        ASSERT_EQ(list.StartOf(i), start) << i;
        ASSERT_EQ(list.Find(start), i);
        ASSERT_EQ(list.Find(start + plain.blocks[i]->Count() - 1), i);
        ASSERT_EQ(list.BlocksBefore(start), i);
        const int16_t* samples = plain.blocks[i]->Samples();
        flat.insert(flat.end(), samples, samples + plain.blocks[i]->Count());
        start += plain.blocks[i]->Count();
    }
    ASSERT_EQ(list.BlocksBefore(start), plain.blocks.size());
    size_t visited = 0;
    list.ForEachBlock([&](const BlockRef& block) { ASSERT_EQ(block.get(), plain.blocks[visited++].get()); });
    ASSERT_EQ(visited, plain.blocks.size());
    // Spans from a few places to a few places read the same samples.
    for (int64_t from : {int64_t(-5), int64_t(0), start / 3, start - 1}) {
        for (int64_t count : {int64_t(1), start / 2, start + 10}) {
            std::vector<int16_t> read;
            list.ForEachSpan(from, count, [&](const SampleSpan& span) {
                read.insert(read.end(), span.samples, span.samples + span.count);
            });
            const int64_t begin = std::clamp<int64_t>(from, 0, start);
            const int64_t end = std::clamp<int64_t>(from + count, 0, start);
            ASSERT_EQ(read, std::vector<int16_t>(flat.begin() + begin, flat.begin() + std::max(begin, end)))
                << from << " " << count;
        }
    }
}

TEST(BlockList, AgreesWithAPlainListThroughThousandsOfSharedAppends)
{
    std::mt19937 random(11);
    std::vector<BlockList> lists(4);
    std::vector<PlainList> plains(4);
    for (int step = 0; step < 400; ++step) {
        const size_t target = random() % lists.size();
        const size_t source = random() % lists.size();
        BlockList built;
        PlainList plain;
        // A list made of a piece of one list, some new blocks and a piece
        // of another: the shape of every edit.
        for (const size_t from : {target, source}) {
            const size_t size = plains[from].blocks.size();
            const size_t first = size == 0 ? 0 : random() % size;
            const size_t count = size == 0 ? 0 : random() % (size - first + 1);
            built.AppendBlocks(lists[from], first, count);
            plain.blocks.insert(plain.blocks.end(), plains[from].blocks.begin() + long(first),
                plains[from].blocks.begin() + long(first + count));
            for (unsigned fresh = random() % 200; fresh > 0; --fresh) {
                BlockRef block = SmallBlock(random);
                plain.blocks.push_back(block);
                built.Append(std::move(block));
            }
        }
        ASSERT_NO_FATAL_FAILURE(ExpectSame(built, plain)) << "step " << step;
        lists[target] = std::move(built);
        plains[target] = std::move(plain);
        // Every other list still reads as it did: nothing shared was changed.
        for (size_t k = 0; k < lists.size(); ++k)
            ASSERT_NO_FATAL_FAILURE(ExpectSame(lists[k], plains[k])) << "list " << k << " step " << step;
    }
}

TEST(BlockList, AppendingToACopyLeavesTheOriginalAsItWas)
{
    std::mt19937 random(3);
    BlockList original;
    PlainList plain;
    for (int i = 0; i < 10; ++i) {
        plain.blocks.push_back(SmallBlock(random));
        original.Append(plain.blocks.back());
    }
    BlockList copy = original;
    copy.Append(SmallBlock(random));
    ExpectSame(original, plain);
    EXPECT_EQ(copy.BlockCount(), 11u);
}

TEST(BlockList, AnEditInTheMiddleSharesTheRunsAroundItNotTheirBlocks)
{
    // Ten runs of full blocks: what the edit leaves alone must not cost a
    // reference per block.
    std::vector<int16_t> samples(BlockBuilder::kBlockSamples, 7);
    BlockList hour;
    std::vector<BlockRef> blocks;
    for (size_t i = 0; i < 10 * BlockList::kRunBlocks; ++i) {
        blocks.push_back(SampleBlock::CopyOf(samples.data(), int64_t(samples.size())));
        hour.Append(blocks.back());
    }
    const int64_t middle = hour.Count() / 2 + 1000;
    BlockBuilder builder;
    builder.AppendRange(hour, 0, middle);
    builder.AppendSamples(samples.data(), 500);
    builder.AppendRange(hour, middle, hour.Count() - middle);
    const BlockList edited = builder.Finish();
    ASSERT_EQ(edited.Count(), hour.Count() + 500);

    // Blocks are held by `blocks` and by `hour`; a block the new list holds
    // through a shared run adds nothing to that.
    int64_t referencedAgain = 0;
    for (const BlockRef& block : blocks)
        referencedAgain += block.use_count() > 2 ? 1 : 0;
    EXPECT_LE(referencedAgain, int64_t(2 * BlockList::kRunBlocks));
    std::vector<int16_t> read(size_t(edited.Count()));
    edited.CopyOut(0, edited.Count(), read.data());
    EXPECT_EQ(read, std::vector<int16_t>(read.size(), 7));
}

}  // namespace
}  // namespace glimmet
