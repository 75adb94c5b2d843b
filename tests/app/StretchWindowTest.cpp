#include <gtest/gtest.h>

#include <QLineEdit>
#include <QMenuBar>
#include <QPointer>
#include <QPushButton>
#include <QTest>
#include <QThread>

#include <mutex>
#include <vector>

#include "AppTestSupport.h"
#include "app/DialogScriptCommands.h"
#include "app/StretchProgress.h"
#include "app/StretchWorker.h"
#include "edit/Action.h"
#include "edit/HistoryManager.h"
#include "edit/dialogs/TSParameterWindow.h"
#include "edit/vocoder/VocoderState.h"
#include "edit/vocoder/VocoderStretch.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"
#include "sound/ChannelSamples.h"

namespace glimmet::test {
namespace {

std::vector<int16_t> SamplesOf(QuillexWindow* window, int32_t channel)
{
    return test::SamplesOf(*window->Manager()->ChannelAt(channel));
}

/// A loaded window with every channel selected over all its frames.
QuillexWindow* SelectedWindow(AppFixture& fixture, const char* name, int channels, int frames)
{
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound(name, channels, frames));
    window->PostMessage(kMsgSelectAll);
    Drain();
    window->Manager()->SetRangeStart(0);
    window->Manager()->SetRangeEnd(frames - 1);
    return window;
}

TSParameterWindow* OpenStretch(QuillexWindow* window)
{
    window->PostMessage(kMsgTimeStretch);
    Drain();
    return DialogScriptCommands::OpenStretchDialog(window);
}

void WaitForStretches()
{
    Drain();  // the click's 'acgo' starts the work
    for (int i = 0; i < 20000 && StretchWorker::Running() > 0; i++) {
        QThread::msleep(1);
        Drain();
    }
    Drain();
}

std::vector<int16_t> Reference(const std::vector<int16_t>& range, int n, int d, int dec, int hop, float factor)
{
    std::vector<float> input(range.size());
    for (size_t i = 0; i < range.size(); i++)
        input[i] = float(range[i]) / 32768.0f;
    const int64_t length = int64_t(float(int64_t(range.size())) * factor);
    std::vector<float> output(static_cast<size_t>(length + 1), 0.0f);
    DiagnosticsCapture quietOut, quietErr(Diagnostics::Channel::Error);
    VocoderStretch::Stretch(
        input.data(), int64_t(input.size()), output.data(), length + 1, n, d, hop, float(dec), factor, 0.0f);
    std::vector<int16_t> samples(static_cast<size_t>(length));
    for (size_t i = 0; i < samples.size(); i++)
        samples[i] = int16_t(uint16_t(int64_t(output[i] * 32767.0f) & 0xFFFF));
    return samples;
}

class StretchWindowTest : public ::testing::Test {
protected:
    void SetUp() override { VocoderState::Shared().Reset(); }
    void TearDown() override { VocoderState::Shared().Reset(); }
};

TEST_F(StretchWindowTest, OnlyAMessageOpensTheDialogAndCancelDropsIt)
{
    AppFixture fixture;
    QuillexWindow* window = SelectedWindow(fixture, "short.wav", 1, 1000);
    for (QAction* top : window->menuBar()->actions()) {
        for (QAction* item : top->menu()->actions())
            EXPECT_FALSE(item->text().contains("Stretch")) << item->text().toStdString();
    }
    TSParameterWindow* dialog = OpenStretch(window);
    ASSERT_NE(dialog, nullptr);
    EXPECT_EQ(dialog->parentWidget(), window);
    EXPECT_EQ(dialog->windowModality(), Qt::WindowModal);
    ASSERT_NE(window->PendingAction(), nullptr);
    EXPECT_STREQ(window->PendingAction()->Name(), "Time Stretch");
    QPointer<TSParameterWindow> watch(dialog);
    QTest::mouseClick(dialog->CancelButton(), Qt::LeftButton);
    Drain();
    EXPECT_EQ(window->PendingAction(), nullptr);
    EXPECT_TRUE(watch.isNull());
    EXPECT_EQ(window->History()->UndoName(), nullptr);
}

TEST_F(StretchWindowTest, DefaultsThenASecondStretchWithAnotherFftLength)
{
    AppFixture fixture;
    QuillexWindow* window = SelectedWindow(fixture, "long.wav", 1, 60000);
    const std::vector<int16_t> before = SamplesOf(window, 0);
    QTest::mouseClick(OpenStretch(window)->OkButton(), Qt::LeftButton);
    WaitForStretches();
    const std::vector<int16_t> once = SamplesOf(window, 0);
    ASSERT_EQ(once.size(), 120000u);
    EXPECT_STREQ(window->History()->UndoName(), "Time Stretch");
    // Undo fails and the history forgets it; the samples stay stretched.
    window->PostMessage(kMsgUndo);
    Drain();
    EXPECT_EQ(window->History()->UndoName(), nullptr);
    EXPECT_EQ(SamplesOf(window, 0), once);

    window->Manager()->SetRangeStart(0);
    window->Manager()->SetRangeEnd(119999);
    TSParameterWindow* dialog = OpenStretch(window);
    ASSERT_NE(dialog, nullptr);
    dialog->Field(0)->setText("1024");
    dialog->Field(2)->setText("0");
    dialog->Field(4)->setText("0.75");
    QTest::mouseClick(dialog->OkButton(), Qt::LeftButton);
    WaitForStretches();
    const std::vector<int16_t> twice = SamplesOf(window, 0);

    VocoderState::Shared().Reset();
    EXPECT_EQ(Reference(before, 8192, 8192, 2048, 2048, 2.0f), once);
    EXPECT_EQ(Reference(once, 1024, 8192, 0, 2048, 0.75f), twice);
    EXPECT_EQ(twice.size(), 90000u);
}

TEST_F(StretchWindowTest, AStretchFactorOfZeroChangesNothing)
{
    AppFixture fixture;
    QuillexWindow* window = SelectedWindow(fixture, "zero.wav", 1, 60000);
    const std::vector<int16_t> before = SamplesOf(window, 0);
    TSParameterWindow* dialog = OpenStretch(window);
    dialog->Field(4)->setText("0");
    DiagnosticsCapture err(Diagnostics::Channel::Error);
    QTest::mouseClick(dialog->OkButton(), Qt::LeftButton);
    WaitForStretches();
    EXPECT_EQ(err.Finish(), "0.0 not a legal stretch factor\n");
    EXPECT_EQ(SamplesOf(window, 0), before);
}

TEST_F(StretchWindowTest, OnlyTheSecondOfTwoChannelsSelected)
{
    AppFixture fixture;
    QuillexWindow* window = SelectedWindow(fixture, "two.wav", 2, 60000);
    window->Manager()->ChannelAt(0)->SetSelected(false);
    const std::vector<int16_t> first = SamplesOf(window, 0);
    QTest::mouseClick(OpenStretch(window)->OkButton(), Qt::LeftButton);
    WaitForStretches();
    EXPECT_EQ(SamplesOf(window, 0), first);
    EXPECT_EQ(SamplesOf(window, 1), std::vector<int16_t>(120000, 0));
}

TEST_F(StretchWindowTest, OtherWindowsKeepWorkingWhileAStretchRuns)
{
    AppFixture fixture;
    QuillexWindow* stretching = SelectedWindow(fixture, "a.wav", 1, 200000);
    QuillexWindow* other = SelectedWindow(fixture, "b.wav", 1, 44100);
    const std::vector<int16_t> before = SamplesOf(stretching, 0);
    const std::vector<int16_t> otherBefore = SamplesOf(other, 0);
    const QString title = stretching->windowTitle();
    {
        // Holding the vocoder keeps the worker waiting, however fast the
        // machine, while the test works the windows.
        std::unique_lock vocoder(VocoderState::Shared().Lock());
        QTest::mouseClick(OpenStretch(stretching)->OkButton(), Qt::LeftButton);
        Drain();
        ASSERT_EQ(StretchWorker::Running(), 1);
        EXPECT_EQ(DialogScriptCommands::OpenStretchDialog(stretching), nullptr);
        // The stretching window says so; the other one does not.
        EXPECT_EQ(stretching->windowTitle(), title + " (stretching 0%)");
        EXPECT_EQ(stretching->cursor().shape(), Qt::BusyCursor);
        EXPECT_FALSE(other->windowTitle().contains("stretching"));

        other->PostMessage(kMsgFadeOut);
        other->PostMessage(kMsgTogglePlay);
        Drain();
        EXPECT_NE(SamplesOf(other, 0), otherBefore);
        EXPECT_STREQ(other->History()->UndoName(), "Fade Out");
        EXPECT_TRUE(other->IsPlaying());
        other->PostMessage(kMsgTogglePlay);

        DiagnosticsCapture out;
        stretching->PostMessage(kMsgFadeOut);
        stretching->PostMessage(kMsgUndo);
        stretching->PostMessage(kMsgTimeStretch);
        Drain();
        EXPECT_EQ(out.Finish(), "Time stretch in progress: Fade Out ignored\nTime stretch in progress: undo ignored\n"
                                "Time stretch in progress: Time Stretch ignored\n");
        EXPECT_EQ(DialogScriptCommands::OpenStretchDialog(stretching), nullptr);
        EXPECT_EQ(SamplesOf(stretching, 0), before);
    }
    WaitForStretches();
    EXPECT_EQ(StretchWorker::Running(), 0);
    EXPECT_EQ(stretching->windowTitle(), title);
    EXPECT_NE(stretching->cursor().shape(), Qt::BusyCursor);
    VocoderState::Shared().Reset();
    EXPECT_EQ(SamplesOf(stretching, 0), Reference(before, 8192, 8192, 2048, 2048, 2.0f));
}

TEST(StretchProgressTest, TheNoteComesAndGoesWithoutTouchingTheRest)
{
    EXPECT_EQ(StretchProgress::TitleWithProgress("Glimmet - a.wav", 0.426), "Glimmet - a.wav (stretching 42%)");
    EXPECT_EQ(StretchProgress::TitleWithProgress("Glimmet - a.wav (stretching 42%)", 1.0),
        "Glimmet - a.wav (stretching 100%)");
    EXPECT_EQ(StretchProgress::PlainTitle("Glimmet - a.wav (stretching 7%)"), "Glimmet - a.wav");
    EXPECT_EQ(StretchProgress::PlainTitle("Glimmet - (stretching 7%).wav"), "Glimmet - (stretching 7%).wav");
}

TEST_F(StretchWindowTest, ClosingTheWindowStopsItsStretch)
{
    AppFixture fixture;
    QuillexWindow* window = fixture.App().NewWindow();
    auto* channel = new Channel();
    channel->SetTo(new int16_t[3000000](), 3000000);
    channel->SetSelected(true);
    window->Manager()->AddChannel(std::unique_ptr<Channel>(channel));
    window->Manager()->SetRangeStart(0);
    window->Manager()->SetRangeEnd(2999999);
    TSParameterWindow* dialog = OpenStretch(window);
    dialog->Field(2)->setText("0");
    DiagnosticsCapture out;
    QTest::mouseClick(dialog->OkButton(), Qt::LeftButton);
    Drain();
    EXPECT_EQ(StretchWorker::Running(), 1);
    window->PostMessage(kMsgQuitRequested);
    Drain();
    EXPECT_FALSE(IsListed(fixture, window));
    EXPECT_EQ(StretchWorker::Running(), 0);
}

}  // namespace
}  // namespace glimmet::test
