#include <gtest/gtest.h>

#include <memory>
#include <vector>

#include "../edit/DocumentMirror.h"
#include "../edit/TransformReference.h"
#include "SoundFixtures.h"
#include "edit/CopyBuffer.h"
#include "edit/EditPosition.h"
#include "edit/FadeInAction.h"
#include "edit/HistoryManager.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "files/DocumentLoader.h"
#include "files/DocumentSaver.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {
namespace {

using test::DocumentMirror;
using test::SoundFixtures;
using test::TransformReference;

constexpr int64_t kFrames = 3000;

/// A stereo signal quiet enough that the save mix gives every sample back
/// unchanged: for |s| <= 10000, s * 32767 / 32768 lies within 0.31 of s.
std::vector<int16_t> QuietStereo()
{
    std::vector<int16_t> interleaved;
    for (int64_t i = 0; i < kFrames; i++) {
        interleaved.push_back(int16_t((i * 37) % 20001 - 10000));
        interleaved.push_back(int16_t(10000 - (i * 53) % 20001));
    }
    return interleaved;
}

std::vector<int16_t> Side(const std::vector<int16_t>& interleaved, size_t side)
{
    std::vector<int16_t> samples;
    for (size_t i = side; i < interleaved.size(); i += 2)
        samples.push_back(interleaved[i]);
    return samples;
}

std::vector<int16_t> Samples(ChannelManager& document, int32_t index)
{
    Channel* channel = document.ChannelAt(index);
    std::vector<int16_t> samples(size_t(channel->FrameCount()));
    channel->FillBuffer(samples.data(), channel->FirstFrame(), channel->FrameCount());
    return samples;
}

/// samples with frames first..last faded in by the reference arithmetic.
std::vector<int16_t> FadedIn(std::vector<int16_t> samples, size_t first, size_t last)
{
    const std::vector<int16_t> part = TransformReference::FadeIn({samples.begin() + long(first), samples.begin() + long(last) + 1});
    std::copy(part.begin(), part.end(), samples.begin() + long(first));
    return samples;
}

void SelectAll(ChannelManager& document)
{
    for (int32_t i = 0; Channel* channel = document.ChannelAt(i); i++)
        channel->SetSelected(true);
}

/// Records action in history and runs it, as the window does on 'acgo'.
void Perform(HistoryManager& history, Action* action, ChannelManager& document, EditPosition& position)
{
    ASSERT_EQ(action->SetTo(&document, &position), B_OK);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    ASSERT_EQ(action->Go(), B_OK);
}

// The engine edits a document on its own: loading, selecting, a transform,
// a cut, a paste, undo, redo and saving need no view and no window, and what
// a view would be told follows the document at every step.
TEST(DocumentWithoutViewsTest, LoadEditUndoRedoAndSave)
{
    SoundFixtures fixtures;
    const std::vector<int16_t> source = QuietStereo();
    const auto path = fixtures.Encode("quiet.wav", source, 44100, 2);
    ASSERT_FALSE(path.empty());

    ChannelManager document(nullptr);
    DocumentMirror mirror(document);
    LoadReport report;
    ASSERT_EQ(DocumentLoader::Load(path, &document, false, &report), B_OK);
    EXPECT_TRUE(report.opened);
    EXPECT_EQ(report.decodedTracks, 1);
    ASSERT_EQ(document.CountChannels(), 2);
    EXPECT_EQ(mirror.shown, mirror.DocumentChannels());
    const std::vector<int16_t> left = Side(source, 0);
    const std::vector<int16_t> right = Side(source, 1);
    ASSERT_EQ(Samples(document, 0), left);
    ASSERT_EQ(Samples(document, 1), right);

    // Fade In over frames 100..999 of both channels.
    HistoryManager history;
    EditPosition position;
    SelectAll(document);
    document.SetRangeStart(100);
    document.SetRangeEnd(999);
    Perform(history, new FadeInAction(nullptr), document, position);
    const std::vector<int16_t> fadedLeft = FadedIn(left, 100, 999);
    const std::vector<int16_t> fadedRight = FadedIn(right, 100, 999);
    EXPECT_EQ(Samples(document, 0), fadedLeft);
    EXPECT_EQ(Samples(document, 1), fadedRight);

    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(Samples(document, 0), left);
    EXPECT_EQ(Samples(document, 1), right);
    ASSERT_EQ(history.Redo(), B_OK);
    EXPECT_EQ(Samples(document, 0), fadedLeft);
    EXPECT_EQ(Samples(document, 1), fadedRight);

    // Cut frames 0..99 of the left channel only.
    document.ChannelAt(1)->SetSelected(false);
    document.SetRangeStart(0);
    document.SetRangeEnd(99);
    Perform(history, new RemoveAction(nullptr), document, position);
    std::vector<int16_t> cutLeft(fadedLeft.begin() + 100, fadedLeft.end());
    EXPECT_EQ(Samples(document, 0), cutLeft);
    EXPECT_EQ(Samples(document, 1), fadedRight);
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(Samples(document, 0), fadedLeft);
    ASSERT_EQ(history.Redo(), B_OK);
    EXPECT_EQ(Samples(document, 0), cutLeft);

    // Paste three frames into the focused right channel at frame 10.
    CopyBuffer copied;
    std::vector<CopyBuffer::Samples> arrays;
    arrays.push_back(CopyBuffer::Samples(new int16_t[3]{7, 8, 9}));
    ASSERT_TRUE(copied.SetCopyBuffer(std::move(arrays), 3));
    position.SetCursorFrame(10);
    position.SetFocusIndex(1);
    document.SetRangeStart(-1);
    document.SetRangeEnd(-1);
    Perform(history, new PasteAction(nullptr, &copied), document, position);
    std::vector<int16_t> pastedRight = fadedRight;
    pastedRight.insert(pastedRight.begin() + 10, {7, 8, 9});
    EXPECT_EQ(Samples(document, 1), pastedRight);
    EXPECT_EQ(Samples(document, 0), cutLeft);
    EXPECT_FALSE(history.IsSaved());

    // Saved and opened again, the document gives its samples back.
    const auto saved = fixtures.PathOf("saved.wav");
    bool created = false;
    DocumentSaver::SaveFile(saved, &document, &history, &created);
    EXPECT_TRUE(created);
    EXPECT_TRUE(history.IsSaved());
    ChannelManager reopened(nullptr);
    ASSERT_EQ(DocumentLoader::Load(saved, &reopened, false), B_OK);
    ASSERT_EQ(reopened.CountChannels(), 2);
    // The left channel is shorter; the mix fills its end with silence.
    std::vector<int16_t> expectedLeft = cutLeft;
    expectedLeft.resize(pastedRight.size(), 0);
    EXPECT_EQ(Samples(reopened, 0), expectedLeft);
    EXPECT_EQ(Samples(reopened, 1), pastedRight);
    EXPECT_EQ(mirror.shown, mirror.DocumentChannels());
}

// Loading into a document replaces its channels, or appends to them, and
// the listeners hear of each channel that comes and goes.
TEST(DocumentWithoutViewsTest, LoadingAnnouncesEveryChannel)
{
    SoundFixtures fixtures;
    const auto path = fixtures.Encode("quiet.wav", QuietStereo(), 44100, 2);
    ChannelManager document(nullptr);
    DocumentMirror mirror(document);
    ASSERT_EQ(DocumentLoader::Load(path, &document, false), B_OK);
    ASSERT_EQ(DocumentLoader::Load(path, &document, true), B_OK);
    EXPECT_EQ(document.CountChannels(), 4);
    EXPECT_EQ(mirror.shown, mirror.DocumentChannels());
    ASSERT_EQ(DocumentLoader::Load(path, &document, false), B_OK);
    EXPECT_EQ(document.CountChannels(), 2);
    EXPECT_EQ(mirror.shown, mirror.DocumentChannels());

    LoadReport report;
    EXPECT_NE(DocumentLoader::Load(fixtures.PathOf("missing.wav"), &document, false, &report), B_OK);
    EXPECT_FALSE(report.opened);
    EXPECT_EQ(document.CountChannels(), 2);
}

}  // namespace
}  // namespace glimmet
