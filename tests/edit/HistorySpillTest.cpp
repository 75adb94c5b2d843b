// The history keeps the blocks only it holds within a memory budget by
// moving the oldest to a nameless scratch file, and every undo still gives
// back exactly what was there.

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <random>
#include <string>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>
#include <vector>

#include "TestDocument.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/HistoryManager.h"
#include "edit/HistorySpill.h"
#include "sound/BlockBuilder.h"
#include "sound/SampleBlock.h"

namespace glimmet {
namespace {

using Samples = std::vector<int16_t>;
using Document = std::vector<Samples>;

constexpr int64_t kFrames = 8 * BlockBuilder::kBlockSamples + 1234;
constexpr int kChannels = 2;
constexpr int64_t kDocumentBytes = kChannels * kFrames * int64_t(sizeof(int16_t));
// What may stay in memory beyond the budget and the document: the blocks in
// use. The history overshoots its budget by one short block here (the 1234
// samples of a channel's last block), so one block's bytes are allowed.
constexpr int64_t kInUseBytes = BlockBuilder::kBlockSamples * int64_t(sizeof(int16_t));

/// Something like music: a few tones and some noise.
Samples MusicLike(unsigned seed)
{
    std::mt19937 random(seed);
    std::normal_distribution<double> noise(0, 300);
    Samples samples(size_t(kFrames), 0);
    for (int64_t i = 0; i < kFrames; i++) {
        const double t = double(i) / 44100;
        const double value = 9000 * std::sin(2 * M_PI * 220 * t) + 4000 * std::sin(2 * M_PI * 331 * t + seed)
            + noise(random);
        samples[size_t(i)] = int16_t(std::lround(std::clamp(value, -32768.0, 32767.0)));
    }
    return samples;
}

Document Read(ChannelManager& manager)
{
    Document document;
    for (int32_t c = 0; Channel* channel = manager.ChannelAt(c); c++) {
        Samples samples(size_t(channel->FrameCount()));
        channel->FillBuffer(samples.data(), channel->FirstFrame(), channel->FrameCount());
        document.push_back(std::move(samples));
    }
    return document;
}

/// Where the descriptor leads, as /proc tells it; empty when it is closed.
std::string LinkOf(int fd)
{
    std::error_code error;
    const auto target = std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(fd), error);
    return error ? std::string() : target.string();
}

bool AnyDescriptorLeadsTo(const std::string& link)
{
    std::error_code error;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd", error)) {
        std::error_code readError;
        if (std::filesystem::read_symlink(entry.path(), readError).string() == link)
            return true;
    }
    return false;
}

template <typename ActionType>
void Perform(test::TestDocument& document, HistoryManager& history)
{
    auto* action = new ActionType(nullptr);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    ASSERT_EQ(action->Go(), B_OK);
    // As the window does once an action has run.
    history.TrimMemory();
}

class HistorySpillTest : public ::testing::Test {
protected:
    void MakeDocument()
    {
        for (int c = 0; c < kChannels; c++)
            document.AddChannel(MusicLike(unsigned(c + 1)));
        document.SetRange(0, kFrames - 1);
    }

    int64_t baseline = SampleBlock::ResidentBytes();
    test::TestDocument document;
};

TEST_F(HistorySpillTest, TenWholeDocumentFadesUndoExactlyWithinTheBudget)
{
    MakeDocument();
    const int64_t budget = kDocumentBytes / 4;
    std::string link;
    {
        HistoryManager history;
        history.SetMemoryBudget(budget);
        std::vector<Document> states{Read(document.manager)};
        for (int i = 0; i < 10; i++) {
            Perform<FadeInAction>(document, history);
            states.push_back(Read(document.manager));
            ASSERT_NE(states.back(), states[states.size() - 2]) << "fade " << i << " changed nothing";
            history.SettleMemory();
            EXPECT_LE(SampleBlock::ResidentBytes() - baseline, budget + kDocumentBytes + kInUseBytes) << "after fade " << i;
        }
        const int fd = history.SpillDescriptor();
        ASSERT_GE(fd, 0) << "nothing was moved out of memory";
        link = LinkOf(fd);
        EXPECT_TRUE(link.ends_with(" (deleted)")) << link;
        for (int i = 10; i > 0; i--) {
            ASSERT_EQ(history.Undo(), B_OK);
            ASSERT_TRUE(Read(document.manager) == states[size_t(i - 1)]) << "undo back to state " << i - 1;
            history.SettleMemory();
            EXPECT_LE(SampleBlock::ResidentBytes() - baseline, budget + kDocumentBytes + kInUseBytes) << "after undo " << i;
        }
        // And forward again, from blocks that went out as redo data.
        for (int i = 1; i <= 10; i++) {
            ASSERT_EQ(history.Redo(), B_OK);
            history.SettleMemory();
            ASSERT_TRUE(Read(document.manager) == states[size_t(i)]) << "redo to state " << i;
        }
    }
    EXPECT_FALSE(AnyDescriptorLeadsTo(link)) << "the scratch file outlived the history";
}

TEST_F(HistorySpillTest, WithoutPressureNothingLeavesMemory)
{
    MakeDocument();
    HistoryManager history;
    history.SetMemoryBudget(20 * kDocumentBytes);
    for (int i = 0; i < 3; i++)
        Perform<FadeOutAction>(document, history);
    history.SettleMemory();
    EXPECT_EQ(history.SpillDescriptor(), -1);
    EXPECT_GE(SampleBlock::ResidentBytes() - baseline, 4 * kDocumentBytes);
}

TEST_F(HistorySpillTest, ClearingTheHistoryClosesTheFile)
{
    MakeDocument();
    HistoryManager history;
    history.SetMemoryBudget(0);
    for (int i = 0; i < 3; i++)
        Perform<FadeInAction>(document, history);
    history.SettleMemory();
    const int fd = history.SpillDescriptor();
    ASSERT_GE(fd, 0);
    const std::string link = LinkOf(fd);
    ASSERT_FALSE(link.empty());
    history.Clear();
    EXPECT_FALSE(AnyDescriptorLeadsTo(link));
    // Only the document is left in memory.
    EXPECT_LE(SampleBlock::ResidentBytes() - baseline, kDocumentBytes);
}

TEST_F(HistorySpillTest, BudgetComesFromTheEnvironment)
{
    const char* old = std::getenv("GLIMMET_HISTORY_BUDGET");
    const std::string saved = old != nullptr ? old : "";
    ::setenv("GLIMMET_HISTORY_BUDGET", "123456", 1);
    EXPECT_EQ(HistoryManager().MemoryBudget(), 123456);
    ::setenv("GLIMMET_HISTORY_BUDGET", "lots", 1);
    const int64_t fallback = HistoryManager().MemoryBudget();
    const int64_t memory = int64_t(::sysconf(_SC_PHYS_PAGES)) * ::sysconf(_SC_PAGE_SIZE);
    EXPECT_EQ(fallback, memory / 4);
    if (old != nullptr)
        ::setenv("GLIMMET_HISTORY_BUDGET", saved.c_str(), 1);
    else
        ::unsetenv("GLIMMET_HISTORY_BUDGET");
}

/// The blocks the document's channels are made of right now. The history
/// keeps them alive once an edit has replaced them.
std::vector<const SampleBlock*> BlocksOf(ChannelManager& manager)
{
    std::vector<const SampleBlock*> blocks;
    for (int32_t c = 0; Channel* channel = manager.ChannelAt(c); c++) {
        channel->ReadSpans(0, channel->FrameCount(),
            [&blocks](const SampleSpan& span) { blocks.push_back(span.block); });
    }
    return blocks;
}

TEST_F(HistorySpillTest, WhatTheNextUndoNeedsStaysInMemoryLongest)
{
    MakeDocument();
    HistoryManager history;
    history.SetMemoryBudget(3 * kDocumentBytes + kInUseBytes);
    Perform<FadeInAction>(document, history);
    const std::vector<const SampleBlock*> afterFirstFade = BlocksOf(document.manager);
    for (int i = 0; i < 3; i++)
        Perform<FadeInAction>(document, history);
    history.SettleMemory();
    ASSERT_EQ(history.Undo(), B_OK);
    ASSERT_EQ(history.Undo(), B_OK);
    history.SettleMemory();
    for (const SampleBlock* block : afterFirstFade)
        ASSERT_TRUE(block->IsResident()) << "the history fitted its budget";

    // Room for two of the three states the history holds in memory: the
    // next undo's (after the first fade), the next redo's (after the third)
    // and the one a second redo would need (after the fourth) goes.
    history.SetMemoryBudget(2 * kDocumentBytes + kInUseBytes);
    history.SettleMemory();
    for (const SampleBlock* block : afterFirstFade)
        EXPECT_TRUE(block->IsResident()) << "block " << block->Id() << " needed by the next undo left memory";
    EXPECT_EQ(history.Undo(), B_OK);
}

/// Blocks of the document that are not resident.
int64_t DroppedBlocks(ChannelManager& manager)
{
    int64_t dropped = 0;
    for (int32_t c = 0; Channel* channel = manager.ChannelAt(c); c++) {
        channel->ReadSpans(0, channel->FrameCount(), [&dropped](const SampleSpan& span) {
            dropped += span.block->IsResident() ? 0 : 1;
        });
    }
    return dropped;
}

TEST_F(HistorySpillTest, BlocksTheDocumentSharesWithTheHistoryStayInMemory)
{
    // Long enough for whole runs of block references: after the fade the
    // document and the fade's record of its result hold the same runs (after
    // the undo, of what it undid), and those blocks are the document's,
    // whatever their own counts say.
    const int64_t frames = int64_t(3 * BlockList::kRunBlocks) * BlockBuilder::kBlockSamples + 777;
    Samples samples(static_cast<size_t>(frames));
    for (int64_t i = 0; i < frames; i++)
        samples[size_t(i)] = int16_t(i * 7 % 20011 - 10000);
    for (int c = 0; c < kChannels; c++)
        document.AddChannel(samples);
    document.SetRange(0, frames - 1);
    HistoryManager history;
    history.SetMemoryBudget(0);
    Perform<FadeInAction>(document, history);
    const Document faded = Read(document.manager);
    history.SettleMemory();
    EXPECT_EQ(DroppedBlocks(document.manager), 0) << "after the fade";
    ASSERT_EQ(history.Undo(), B_OK);
    history.SettleMemory();
    ASSERT_GE(history.SpillDescriptor(), 0) << "nothing was ever moved out";
    EXPECT_EQ(DroppedBlocks(document.manager), 0) << "after the undo";
    EXPECT_EQ(Read(document.manager), Document(size_t(kChannels), samples));
    ASSERT_EQ(history.Redo(), B_OK);
    history.SettleMemory();
    EXPECT_EQ(DroppedBlocks(document.manager), 0) << "after the redo";
    EXPECT_EQ(Read(document.manager), faded);
}

int64_t FileBytes(int fd)
{
    struct stat status {};
    return fd >= 0 && ::fstat(fd, &status) == 0 ? int64_t(status.st_size) : -1;
}

TEST(HistorySpillPause, TheWorkerLeavesTheFileAloneWhilePaused)
{
    HistorySpill spill;
    spill.SetBudget(0);
    const std::vector<int16_t> samples(size_t(BlockBuilder::kBlockSamples), 7);
    // This list plays the history's: nothing else holds its blocks.
    BlockList blocks;
    for (int i = 0; i < 16; i++)
        blocks.Append(SampleBlock::CopyOf(samples.data(), int64_t(samples.size())));
    const std::vector<const BlockList*> kept{&blocks};
    spill.Pause();
    spill.Trim(kept);
    ASSERT_GE(spill.FileDescriptor(), 0) << "nothing was handed to the worker";
    // Long enough for the worker to have written something if it were free to.
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    EXPECT_EQ(FileBytes(spill.FileDescriptor()), 0);
    spill.Resume();
    spill.WaitUntilWritten();
    EXPECT_EQ(FileBytes(spill.FileDescriptor()), blocks.Count() * int64_t(sizeof(int16_t)));
    spill.Trim(kept);
    blocks.ForEachBlock([](const BlockRef& block) { EXPECT_FALSE(block->IsResident()); });
}

/// Mixing reads the channels the whole time while the history writes
/// blocks out, drops them and reads them back; every undo stays exact.
TEST(HistorySpillStress, MixingWhileSpillingAndUndoing)
{
    test::TestDocument document;
    for (int c = 0; c < kChannels; c++)
        document.AddChannel(MusicLike(unsigned(c + 7)));
    document.SetRange(0, kFrames - 1);
    std::atomic<bool> written{false};
    HistoryManager history;
    history.SetMemoryBudget(0);
    history.SetSpillWrittenCallback([&written] { written = true; });

    std::atomic<bool> done{false};
    std::atomic<int64_t> reads{0};
    std::vector<Channel*> channels;
    for (int c = 0; c < kChannels; c++)
        channels.push_back(document.manager.ChannelAt(c));
    std::thread mixer([&] {
        int64_t start = 0;
        int64_t sum = 0;
        while (!done) {
            for (Channel* channel : channels) {
                channel->ReadForMix(start, 4096, [&sum](const Channel::MixSource& source) {
                    for (int64_t i = 0; i < source.length; i++)
                        sum += source.samples[i];
                });
            }
            start = (start + 4096) % kFrames;
            ++reads;
        }
        EXPECT_NE(sum, 1);  // keeps the reads
    });

    const Document original = Read(document.manager);
    std::vector<Document> states{original};
    std::mt19937 random(5);
    for (int step = 0; step < 60; step++) {
        if (written.exchange(false))
            history.TrimMemory();
        const int choice = int(random() % 4);
        if (choice < 2 || states.size() == 1) {
            if (choice == 0)
                Perform<FadeInAction>(document, history);
            else
                Perform<FadeOutAction>(document, history);
            states.push_back(Read(document.manager));
        } else {
            ASSERT_EQ(history.Undo(), B_OK);
            states.pop_back();
            ASSERT_TRUE(Read(document.manager) == states.back()) << "step " << step;
        }
        if (step % 7 == 0)
            history.SettleMemory();
    }
    while (states.size() > 1) {
        ASSERT_EQ(history.Undo(), B_OK);
        states.pop_back();
        ASSERT_TRUE(Read(document.manager) == states.back());
    }
    done = true;
    mixer.join();
    EXPECT_GT(reads.load(), 0);
    EXPECT_TRUE(Read(document.manager) == original);
}

}  // namespace
}  // namespace glimmet
