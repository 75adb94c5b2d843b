#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <numeric>
#include <random>
#include <sys/stat.h>
#include <vector>

#include "sound/SampleBlock.h"
#include "sound/SpillFile.h"

namespace glimmet {
namespace {

constexpr int64_t kRun = 64 * 1024;

std::vector<char> Pattern(int seed, int64_t bytes)
{
    std::vector<char> data(static_cast<size_t>(bytes));
    std::mt19937 random(static_cast<unsigned>(seed));
    for (char& c : data)
        c = char(random());
    return data;
}

struct stat StatOf(const SpillFile& file)
{
    struct stat info {};
    EXPECT_EQ(::fstat(file.Descriptor(), &info), 0);
    return info;
}

TEST(SpillFile, ReadManyGivesBackEveryRunWhereverItLies)
{
    std::shared_ptr<SpillFile> file = SpillFile::Create();
    ASSERT_NE(file, nullptr);
    // Runs of two sizes, some end to end and some with a released run
    // between them, asked for in a shuffled order.
    std::vector<std::vector<char>> written;
    std::vector<int64_t> offsets;
    for (int i = 0; i < 40; i++) {
        written.push_back(Pattern(i, i % 7 == 3 ? 1000 : kRun));
        offsets.push_back(file->Write(written.back().data(), int64_t(written.back().size())));
        ASSERT_GE(offsets.back(), 0);
    }
    std::vector<size_t> wanted;
    for (size_t i = 0; i < written.size(); i++) {
        if (i % 5 == 2)
            file->Release(offsets[i], int64_t(written[i].size()));
        else
            wanted.push_back(i);
    }
    std::shuffle(wanted.begin(), wanted.end(), std::mt19937(3));
    std::vector<std::vector<char>> read(written.size());
    std::vector<SpillFile::Piece> pieces;
    for (size_t i : wanted) {
        read[i].assign(written[i].size(), 0);
        pieces.push_back(SpillFile::Piece{offsets[i], read[i].data(), int64_t(read[i].size())});
    }
    ASSERT_TRUE(file->ReadMany(pieces));
    for (size_t i : wanted)
        EXPECT_EQ(read[i], written[i]) << "run " << i;
}

TEST(SpillFile, ReadManyPastTheEndFails)
{
    std::shared_ptr<SpillFile> file = SpillFile::Create();
    ASSERT_NE(file, nullptr);
    const std::vector<char> data = Pattern(1, kRun);
    const int64_t offset = file->Write(data.data(), kRun);
    std::vector<char> target(size_t(2 * kRun));
    std::vector<SpillFile::Piece> pieces{{offset, target.data(), kRun}, {offset + kRun, target.data() + kRun, kRun}};
    EXPECT_FALSE(file->ReadMany(pieces));
}

TEST(SpillFile, ReleasedSpaceIsHandedBackOnlyWhenPunched)
{
    std::shared_ptr<SpillFile> file = SpillFile::Create();
    ASSERT_NE(file, nullptr);
    std::vector<int64_t> offsets;
    for (int i = 0; i < 32; i++)
        offsets.push_back(file->Write(Pattern(i, kRun).data(), kRun));
    const struct stat full = StatOf(*file);
    for (const int64_t offset : offsets)
        file->Release(offset, kRun);
    // Releasing is bookkeeping only: no call that may wait on the disk.
    EXPECT_EQ(file->UnpunchedBytes(), 32 * kRun);
    EXPECT_EQ(StatOf(*file).st_blocks, full.st_blocks);
    file->PunchReleased();
    EXPECT_EQ(file->UnpunchedBytes(), 0);
    EXPECT_LT(StatOf(*file).st_blocks, full.st_blocks);
    EXPECT_EQ(file->StoredBytes(), 0);
}

TEST(SpillFile, SpaceReleasedAndNotPunchedIsReusedByTheNextWrite)
{
    std::shared_ptr<SpillFile> file = SpillFile::Create();
    ASSERT_NE(file, nullptr);
    const std::vector<char> first = Pattern(1, kRun);
    const std::vector<char> second = Pattern(2, kRun);
    const int64_t offset = file->Write(first.data(), kRun);
    file->Release(offset, kRun);
    EXPECT_EQ(file->Write(second.data(), kRun), offset);
    EXPECT_EQ(file->UnpunchedBytes(), 0);
    // A punch now must leave the rewritten run alone.
    file->PunchReleased();
    std::vector<char> read(static_cast<size_t>(kRun));
    ASSERT_TRUE(file->Read(offset, read.data(), kRun));
    EXPECT_EQ(read, second);
}

/// count blocks of distinct samples, written to file and dropped.
std::vector<BlockRef> DroppedBlocks(const std::shared_ptr<SpillFile>& file, int count)
{
    std::vector<BlockRef> blocks;
    for (int b = 0; b < count; b++) {
        // Mostly full blocks, some odd sizes, as a channel's edits leave.
        const int64_t samples = b % 9 == 4 ? 777 : 32768;
        std::vector<int16_t> values(static_cast<size_t>(samples));
        std::iota(values.begin(), values.end(), int16_t(b * 131));
        blocks.push_back(SampleBlock::CopyOf(values.data(), samples));
        EXPECT_TRUE(blocks.back()->WriteCopy(file));
        EXPECT_TRUE(blocks.back()->DropSamples());
    }
    return blocks;
}

TEST(SpillFile, BlocksReadBackTogetherHoldTheirOwnSamples)
{
    std::shared_ptr<SpillFile> file = SpillFile::Create();
    ASSERT_NE(file, nullptr);
    std::vector<BlockRef> blocks = DroppedBlocks(file, 1500);  // more than one batch
    // Asked for in another order than written, one of them twice, and one
    // already back.
    std::vector<const SampleBlock*> wanted;
    for (const BlockRef& block : blocks)
        wanted.push_back(block.get());
    std::shuffle(wanted.begin(), wanted.end(), std::mt19937(5));
    wanted.push_back(wanted.front());
    ASSERT_TRUE(blocks[10]->MakeResident());
    ASSERT_TRUE(SampleBlock::MakeResident(wanted));
    for (size_t b = 0; b < blocks.size(); b++) {
        ASSERT_TRUE(blocks[b]->IsResident());
        EXPECT_FALSE(blocks[b]->HasFileCopy());
        const int16_t* samples = blocks[b]->Samples();
        for (int64_t i = 0; i < blocks[b]->Count(); i += 997)
            ASSERT_EQ(samples[i], int16_t(b * 131 + i)) << "block " << b << " sample " << i;
    }
    EXPECT_EQ(file->StoredBytes(), 0);
}

TEST(SpillFile, ResidentBlocksAmongDroppedOnesAreLeftAsTheyAre)
{
    std::shared_ptr<SpillFile> file = SpillFile::Create();
    ASSERT_NE(file, nullptr);
    std::vector<BlockRef> blocks = DroppedBlocks(file, 3);
    blocks.push_back(SampleBlock::CopyOf(std::vector<int16_t>(100, 5).data(), 100));
    // A resident block is fine; every dropped one comes back.
    std::vector<const SampleBlock*> wanted{blocks[0].get(), blocks[3].get(), blocks[2].get()};
    EXPECT_TRUE(SampleBlock::MakeResident(wanted));
    EXPECT_TRUE(blocks[0]->IsResident());
    EXPECT_TRUE(blocks[2]->IsResident());
    EXPECT_FALSE(blocks[1]->IsResident());
}

}  // namespace
}  // namespace glimmet
