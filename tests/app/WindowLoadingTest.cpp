#include <gtest/gtest.h>

#include <QLabel>
#include <QPointer>
#include <QTest>

#include <atomic>
#include <chrono>
#include <thread>

#include "AppTestSupport.h"
#include "app/LoadQueue.h"
#include "app/TextControl.h"
#include "files/BackgroundLoad.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "views/ChannelContainerView.h"
#include "views/ZoomSlider.h"

namespace glimmet::test {
namespace {

/// Holds every load of a file called name in its worker until released or
/// cancelled.
class LoadGate {
public:
    explicit LoadGate(std::string name)
    {
        BackgroundLoad::SetWorkerHook([this, name](const std::filesystem::path& file, const LoadProgress& progress) {
            if (file.filename() != name)
                return;
            held_ = true;
            while (!released_.load() && !progress.IsCancelled())
                std::this_thread::sleep_for(std::chrono::milliseconds(1));
            if (progress.IsCancelled())
                sawCancel_ = true;
        });
    }
    ~LoadGate() { BackgroundLoad::SetWorkerHook(nullptr); }

    void Release() { released_ = true; }
    bool Held() const { return held_.load(); }
    bool SawCancel() const { return sawCancel_.load(); }

private:
    std::atomic<bool> released_{false};
    std::atomic<bool> held_{false};
    std::atomic<bool> sawCancel_{false};
};

/// Lets the event loop run for a while without waiting for loads.
void Spin(int milliseconds)
{
    QTest::qWait(milliseconds);
    DrainPosted();
}

std::vector<int16_t> Samples(Channel* channel)
{
    std::vector<int16_t> samples(size_t(channel->FrameCount()));
    channel->FillBuffer(samples.data(), 0, channel->FrameCount());
    return samples;
}

TEST(WindowLoading, OpenedFileEndsAsASynchronousLoad)
{
    AppFixture fixture;
    const auto first = fixture.MakeSound("first.wav", 2, 5000);
    const auto more = fixture.MakeSound("more.wav", 1, 3000);
    QuillexWindow* direct = fixture.App().NewWindow();
    QuillexWindow* background = fixture.App().NewWindow();
    direct->SetTo(first);
    direct->SetAppendOnLoad(true);
    direct->SetTo(more);
    background->OpenFile(first);
    background->SetAppendOnLoad(true);
    background->OpenFile(more);
    EXPECT_TRUE(background->IsLoading());
    Drain();
    EXPECT_FALSE(background->IsLoading());

    ASSERT_EQ(background->Manager()->CountChannels(), 3);
    ASSERT_EQ(direct->Manager()->CountChannels(), 3);
    for (int32_t i = 0; i < 3; ++i) {
        Channel* expected = direct->Manager()->ChannelAt(i);
        Channel* got = background->Manager()->ChannelAt(i);
        EXPECT_EQ(Samples(got), Samples(expected)) << i;
        EXPECT_EQ(got->PanPosition(), expected->PanPosition());
        EXPECT_EQ(got->FrameRate(), expected->FrameRate());
    }
    EXPECT_EQ(background->windowTitle(), direct->windowTitle());
    EXPECT_EQ(background->windowTitle(), "Glimmet - first.wav");
    EXPECT_EQ(background->FileEntry(), direct->FileEntry());
    EXPECT_EQ(background->ContainerView()->FirstDisplayedFrame(),
        direct->ContainerView()->FirstDisplayedFrame());
    EXPECT_EQ(background->ContainerView()->LastDisplayedFrame(), direct->ContainerView()->LastDisplayedFrame());
    EXPECT_EQ(background->GetZoomSlider()->Left(), direct->GetZoomSlider()->Left());
    EXPECT_EQ(background->GetZoomSlider()->Right(), direct->GetZoomSlider()->Right());
}

TEST(WindowLoading, ProgressShowsAndTheWindowKeepsWorkingWhileAFileLoads)
{
    AppFixture fixture;
    const auto slow = fixture.MakeSound("slow.wav", 1, 4000);
    const auto quick = fixture.MakeSound("quick.wav", 1, 100);
    LoadGate gate("slow.wav");
    QuillexWindow* window = fixture.App().NewWindow();
    QuillexWindow* other = fixture.App().NewWindow();
    window->OpenFile(slow);
    Spin(100);
    ASSERT_TRUE(gate.Held());
    EXPECT_TRUE(window->IsLoading());
    QLabel* line = window->Loads()->ProgressLine();
    ASSERT_NE(line, nullptr);
    EXPECT_TRUE(line->isVisible());
    EXPECT_TRUE(line->text().startsWith("Loading slow.wav")) << line->text().toStdString();
    EXPECT_EQ(window->Manager()->CountChannels(), 0);

    // Commands are handled meanwhile, and another window loads its own file.
    Message start(kMsgRangeStartChanged);
    start.AddInt64(kFieldRangeStart, 42);
    window->PostMessage(start);
    other->OpenFile(quick);
    Spin(300);
    EXPECT_EQ(window->RangeStartField()->Text(), "42");
    EXPECT_FALSE(other->IsLoading());
    EXPECT_EQ(other->Manager()->CountChannels(), 1);
    EXPECT_TRUE(window->IsLoading());
    EXPECT_EQ(window->Manager()->CountChannels(), 0);

    gate.Release();
    Drain();
    EXPECT_FALSE(window->IsLoading());
    EXPECT_FALSE(line->isVisible());
    ASSERT_EQ(window->Manager()->CountChannels(), 1);
    EXPECT_EQ(window->Manager()->ChannelAt(0)->FrameCount(), 4000);
    EXPECT_EQ(window->windowTitle(), "Glimmet - slow.wav");
}

// The progress line is refreshed on a timer; the hand-over does not wait
// for it. Only the load's own posted call runs here, never a timer.
TEST(WindowLoading, AFinishedLoadIsHandedOverWithoutWaitingForTheProgressTimer)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("prompt.wav", 2, 3000);
    QuillexWindow* window = fixture.App().NewWindow();
    window->OpenFile(file);
    ASSERT_TRUE(window->IsLoading());
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (window->IsLoading() && std::chrono::steady_clock::now() < deadline) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
        QCoreApplication::sendPostedEvents(window->Loads(), QEvent::MetaCall);
    }
    EXPECT_FALSE(window->IsLoading());
    ASSERT_EQ(window->Manager()->CountChannels(), 2);
    EXPECT_EQ(window->Manager()->ChannelAt(0)->FrameCount(), 3000);
    EXPECT_EQ(LoadQueue::CountInFlight(), 0);
}

TEST(WindowLoading, ClosingTheWindowDuringALoadGivesTheLoadUp)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("closed.wav", 2, 4000);
    LoadGate gate("closed.wav");
    fixture.App().ArgvReceived({"glimmet", QString::fromStdString(file.string())});
    ASSERT_EQ(fixture.App().CountWindows(), 1);
    QPointer<QuillexWindow> window = fixture.App().WindowAt(0);
    Spin(50);
    ASSERT_TRUE(gate.Held());
    EXPECT_EQ(LoadQueue::CountInFlight(), 1);

    window->PostMessage(kMsgQuitRequested);
    Drain(2000);
    EXPECT_TRUE(window.isNull());
    EXPECT_EQ(fixture.App().CountWindows(), 0);
    EXPECT_TRUE(gate.SawCancel());
    EXPECT_EQ(LoadQueue::CountInFlight(), 0);
}

TEST(WindowLoading, DroppedFilesLoadInTheBackground)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("kept.wav", 1, 500));
    const auto dropped = fixture.MakeSound("dropped.wav", 2, 800);
    LoadGate gate("dropped.wav");
    Message drop(kMsgSimpleData);
    drop.AddPath(kFieldRefs, dropped);
    drop.AddInt32(kFieldModifiers, 0);
    window->PostMessage(drop);
    Spin(50);
    EXPECT_TRUE(window->IsLoading());
    EXPECT_EQ(window->Manager()->CountChannels(), 1);
    EXPECT_EQ(window->windowTitle(), "Glimmet - kept.wav");
    gate.Release();
    Drain();
    EXPECT_EQ(window->Manager()->CountChannels(), 2);
    EXPECT_EQ(window->windowTitle(), "Glimmet - dropped.wav");
}

}  // namespace
}  // namespace glimmet::test
