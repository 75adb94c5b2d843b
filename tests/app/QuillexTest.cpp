#include <gtest/gtest.h>

#include <QDesktopServices>
#include <QFileDialog>
#include <QUrl>

#include "AppTestSupport.h"
#include "app/MenuTable.h"
#include "files/panel/SndFilePanel.h"
#include "support/MessageCodes.h"

namespace glimmet::test {
namespace {

QString Title(QuillexWindow* window)
{
    return window->windowTitle();
}

Message Refs(const std::vector<std::filesystem::path>& paths)
{
    Message refs(kMsgRefsReceived);
    for (const std::filesystem::path& path : paths)
        refs.AddPath("refs", path);
    return refs;
}

TEST(Quillex, IsTheInstanceWhileItLives)
{
    {
        AppFixture fixture;
        EXPECT_EQ(Quillex::Instance(), &fixture.App());
    }
    EXPECT_EQ(Quillex::Instance(), nullptr);
}

TEST(Quillex, LaunchWithoutArgumentsShowsOneEmptyWindow)
{
    AppFixture fixture;
    fixture.App().ArgvReceived({"glimmet"});
    fixture.App().ReadyToRun();
    ASSERT_EQ(fixture.App().CountWindows(), 1);
    QuillexWindow* window = fixture.App().WindowAt(0);
    EXPECT_TRUE(window->isVisible());
    EXPECT_EQ(Title(window), "Glimmet");
    EXPECT_FALSE(window->FileEntry().has_value());
}

TEST(Quillex, TwoValidPathsAndOneInvalidGiveTwoLoadedWindows)
{
    AppFixture fixture;
    const auto first = fixture.MakeSound("first.wav");
    const auto second = fixture.MakeSound("second.wav", 2);
    fixture.App().ArgvReceived({"glimmet", QString::fromStdString(first.string()),
        QString::fromStdString((fixture.Dir() / "nowhere" / "missing.wav").string()),
        QString::fromStdString(second.string())});
    fixture.App().ReadyToRun();
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 2);
    EXPECT_EQ(Title(fixture.App().WindowAt(0)), "Glimmet - first.wav");
    EXPECT_EQ(Title(fixture.App().WindowAt(1)), "Glimmet - second.wav");
    EXPECT_EQ(fixture.App().WindowAt(0)->FileEntry(), first);
    EXPECT_EQ(fixture.App().WindowAt(1)->FileEntry(), second);
}

TEST(Quillex, RelativeArgumentsAreResolved)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("relative.wav");
    const auto previous = std::filesystem::current_path();
    std::filesystem::current_path(fixture.Dir());
    fixture.App().ArgvReceived({"glimmet", "relative.wav"});
    std::filesystem::current_path(previous);
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 1);
    EXPECT_EQ(fixture.App().WindowAt(0)->FileEntry(), file);
}

TEST(Quillex, OpenInWindowAThenTwoRefsLoadsFirstIntoAAndSecondIntoANewWindow)
{
    AppFixture fixture;
    const auto one = fixture.MakeSound("one.wav");
    const auto two = fixture.MakeSound("two.wav");
    fixture.App().ReadyToRun();
    QuillexWindow* a = fixture.App().WindowAt(0);
    a->PostMessage(kMsgOpen);
    Drain();
    EXPECT_EQ(fixture.App().OpenRequestingWindow(), a);
    ASSERT_NE(fixture.App().OpenPanel(), nullptr);
    EXPECT_TRUE(fixture.App().OpenPanel()->isVisible());
    fixture.App().OpenPanel()->hide();

    fixture.App().PostMessage(Refs({one, two}));
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 2);
    EXPECT_EQ(fixture.App().WindowAt(0), a);
    EXPECT_EQ(a->FileEntry(), one);
    EXPECT_EQ(fixture.App().WindowAt(1)->FileEntry(), two);
    EXPECT_EQ(fixture.App().OpenRequestingWindow(), nullptr);
}

TEST(Quillex, CancelledOpenPanelSendsLaterFilesToNewWindows)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("later.wav");
    fixture.App().ReadyToRun();
    QuillexWindow* a = fixture.App().WindowAt(0);
    a->PostMessage(kMsgOpen);
    Drain();
    ASSERT_NE(fixture.App().OpenPanel(), nullptr);
    fixture.App().OpenPanel()->reject();
    Drain();
    EXPECT_EQ(fixture.App().OpenRequestingWindow(), nullptr);

    fixture.App().PostMessage(Refs({file}));
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 2);
    EXPECT_FALSE(a->FileEntry().has_value());
    EXPECT_EQ(fixture.App().WindowAt(1)->FileEntry(), file);
}

TEST(Quillex, OpenPanelChoiceArrivesAsRefs)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("chosen.wav");
    fixture.App().ReadyToRun();
    QuillexWindow* a = fixture.App().WindowAt(0);
    a->PostMessage(kMsgOpen);
    Drain();
    QFileDialog* panel = fixture.App().OpenPanel();
    ASSERT_NE(panel, nullptr);
    // What the panel reports when the user picks a file and presses Open.
    emit panel->filesSelected({QString::fromStdString(file.string())});
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 1);
    EXPECT_EQ(a->FileEntry(), file);
}

TEST(Quillex, AppendAsksForTheOpenPanelWithTheWindowAndSetsAppendOnLoad)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    QuillexWindow* a = fixture.App().WindowAt(0);
    a->PostMessage(kMsgAppend);
    Drain();
    EXPECT_TRUE(a->AppendOnLoad());
    EXPECT_EQ(fixture.App().OpenRequestingWindow(), a);
    a->PostMessage(kMsgOpen);
    Drain();
    EXPECT_FALSE(a->AppendOnLoad());
}

TEST(Quillex, OpenWithoutWindowKeepsThePreviousRequester)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    QuillexWindow* a = fixture.App().WindowAt(0);
    a->PostMessage(kMsgOpen);
    Drain();
    fixture.App().PostMessage(kMsgOpen);
    Drain();
    EXPECT_EQ(fixture.App().OpenRequestingWindow(), a);
}

TEST(Quillex, NewWindowMessageMakesAWindow)
{
    AppFixture fixture;
    fixture.App().PostMessage(kMsgNewWindow);
    fixture.App().PostMessage(kMsgNewWindow);
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 2);
}

TEST(Quillex, CopyBufferRefusesEmptyInputAndKeepsTheOldOne)
{
    AppFixture fixture;
    std::vector<const int16_t*> channels;
    int32_t count = -7;
    int64_t frames = -7;
    EXPECT_FALSE(fixture.App().GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(count, -7);
    EXPECT_EQ(frames, -7);

    std::vector<CopyBuffer::Samples> first;
    first.push_back(CopyBuffer::Samples(new int16_t[3]()));
    first[0][1] = 42;
    ASSERT_TRUE(fixture.App().SetCopyBuffer(std::move(first), 3));

    EXPECT_FALSE(fixture.App().SetCopyBuffer({}, 5));
    std::vector<CopyBuffer::Samples> noFrames;
    noFrames.push_back(CopyBuffer::Samples(new int16_t[1]()));
    EXPECT_FALSE(fixture.App().SetCopyBuffer(std::move(noFrames), 0));

    ASSERT_TRUE(fixture.App().GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(count, 1);
    EXPECT_EQ(frames, 3);
    ASSERT_EQ(channels.size(), 1u);
    // The first copy's samples, whatever storage holds them now.
    EXPECT_EQ(std::vector<int16_t>(channels[0], channels[0] + 3), (std::vector<int16_t>{0, 42, 0}));
}

TEST(Quillex, TwoReadsOfTheCopyBufferShareTheSampleArrays)
{
    AppFixture fixture;
    std::vector<CopyBuffer::Samples> arrays;
    arrays.push_back(CopyBuffer::Samples(new int16_t[4]()));
    arrays.push_back(CopyBuffer::Samples(new int16_t[4]()));
    ASSERT_TRUE(fixture.App().SetCopyBuffer(std::move(arrays), 4));
    std::vector<const int16_t*> first, second;
    int32_t count = 0;
    int64_t frames = 0;
    ASSERT_TRUE(fixture.App().GetCopyBuffer(first, count, frames));
    ASSERT_TRUE(fixture.App().GetCopyBuffer(second, count, frames));
    EXPECT_NE(first.data(), second.data());
    EXPECT_EQ(first, second);
    EXPECT_EQ(count, 2);
}

TEST(Quillex, TheApplicationBufferIsTheOneEditsFind)
{
    AppFixture fixture;
    const CopyBuffer* edits = fixture.App().NewWindow()->SharedCopyBuffer();
    ASSERT_NE(edits, nullptr);
    std::vector<CopyBuffer::Samples> arrays;
    arrays.push_back(CopyBuffer::Samples(new int16_t[2]()));
    ASSERT_TRUE(fixture.App().SetCopyBuffer(std::move(arrays), 2));
    std::vector<const int16_t*> channels;
    int32_t count = 0;
    int64_t frames = 0;
    EXPECT_TRUE(edits->GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(frames, 2);
}

TEST(Quillex, DeleteWindowIgnoresNullAndStrangers)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    EXPECT_FALSE(fixture.App().DeleteWindow(nullptr));
    QuillexWindow stranger;
    EXPECT_FALSE(fixture.App().DeleteWindow(&stranger));
    fixture.App().PostMessage(kMsgDeleteWindow);  // no "window" field
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 1);
    EXPECT_EQ(fixture.QuitCount(), 0);
}

TEST(Quillex, ClosingTheLastWindowQuits)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    fixture.App().PostMessage(kMsgNewWindow);
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 2);
    fixture.App().WindowAt(0)->PostMessage(kMsgQuitRequested);
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 1);
    EXPECT_EQ(fixture.QuitCount(), 0);
    fixture.App().WindowAt(0)->PostMessage(kMsgQuitRequested);
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 0);
    EXPECT_EQ(fixture.QuitCount(), 1);
}

TEST(Quillex, QuitWithThreeWindowsStopsAtTheOneThatRefuses)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("edited.wav");
    fixture.App().ReadyToRun();
    fixture.App().PostMessage(Refs({file}));
    fixture.App().PostMessage(kMsgNewWindow);
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 3);
    QuillexWindow* refusing = fixture.App().WindowAt(1);
    ASSERT_EQ(refusing->FileEntry(), file);
    int asked = 0;
    QuillexWindow::SetSaveQuestion([&](QuillexWindow* window) {
        ++asked;
        EXPECT_EQ(window, refusing);
        return int(QuillexWindow::kDontQuit);
    });
    MakeUnsaved(refusing);

    fixture.App().PostMessage(kMsgQuitRequested);
    Drain();
    EXPECT_EQ(asked, 1);
    ASSERT_EQ(fixture.App().CountWindows(), 1);
    EXPECT_EQ(fixture.App().WindowAt(0), refusing);
    EXPECT_TRUE(refusing->isVisible());
    EXPECT_EQ(fixture.QuitCount(), 0);
}

TEST(Quillex, QuitWithoutWindowsIsAgreed)
{
    AppFixture fixture;
    EXPECT_TRUE(fixture.App().QuitRequested());
    fixture.App().PostMessage(kMsgQuitRequested);
    Drain();
    EXPECT_EQ(fixture.QuitCount(), 1);
}

TEST(Quillex, TogglingBubbleHelpTwiceReturnsItToOffAndMarksEveryWindow)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    fixture.App().PostMessage(kMsgNewWindow);
    Drain();
    EXPECT_FALSE(fixture.App().IsBubbleHelpEnabled());
    fixture.App().PostMessage(kMsgToggleBubbleHelp);
    Drain();
    EXPECT_TRUE(fixture.App().IsBubbleHelpEnabled());
    for (int32_t i = 0; i < 2; ++i)
        EXPECT_TRUE(fixture.App().WindowAt(i)->MenuItem(KeptMenuItem::BubbleHelp)->isChecked());
    fixture.App().PostMessage(kMsgToggleBubbleHelp);
    Drain();
    EXPECT_FALSE(fixture.App().IsBubbleHelpEnabled());
    for (int32_t i = 0; i < 2; ++i)
        EXPECT_FALSE(fixture.App().WindowAt(i)->MenuItem(KeptMenuItem::BubbleHelp)->isChecked());
}

/// Catches the mailto: URL the feedback item opens.
class MailCatcher : public QObject {
    Q_OBJECT

public:
    QList<QUrl> urls;

public slots:
    void Open(const QUrl& url) { urls << url; }
};

TEST(Quillex, FeedbackOpensAMailToTheMaintainers)
{
    AppFixture fixture;
    MailCatcher catcher;
    QDesktopServices::setUrlHandler("mailto", &catcher, "Open");
    fixture.App().PostMessage(kMsgFeedback);
    Drain();
    QDesktopServices::unsetUrlHandler("mailto");
    ASSERT_EQ(catcher.urls.size(), 1);
    EXPECT_EQ(catcher.urls[0].toString(), QString("mailto:") + Quillex::kFeedbackAddress);
}

}  // namespace
}  // namespace glimmet::test

#include "QuillexTest.moc"
