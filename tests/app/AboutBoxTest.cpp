#include <gtest/gtest.h>

#include <QApplication>
#include <QElapsedTimer>
#include <QMenuBar>
#include <QPointer>
#include <QScreen>
#include <QTest>

#include <memory>
#include <vector>

#include "AboutTestSupport.h"
#include "AppTestSupport.h"
#include "app/AboutView.h"
#include "app/AboutWindow.h"
#include "app/PacedRunner.h"
#include "support/MessageCodes.h"

namespace glimmet::test {
namespace {

const QString kTitle = QStringLiteral("G l i m m e t");

/// An About box whose animation moves only when the test fires its runner.
struct ManualAbout {
    RunnerLog log;
    QPointer<AboutWindow> window = new AboutWindow(std::make_unique<ManualRunner>(&log));

    ~ManualAbout() { delete window.data(); }
    AboutView& View() const { return *window->View(); }
    /// Fires the runner until it asks for something other than frames;
    /// returns the number of frames drawn.
    int FramesUntilPhaseEnds()
    {
        int frames = 0;
        while (log.what == kMsgAboutDraw) {
            log.Fire();
            ++frames;
        }
        return frames;
    }
    /// Runs a whole line: condensing, the hold, dissolving, the switch.
    void RunLine()
    {
        FramesUntilPhaseEnds();
        log.Fire();  // the hold is over
        FramesUntilPhaseEnds();
        log.Fire();  // the next line
    }
};

std::vector<AboutWindow*> OpenAboutWindows()
{
    std::vector<AboutWindow*> found;
    for (QWidget* widget : QApplication::topLevelWidgets()) {
        if (auto* about = qobject_cast<AboutWindow*>(widget); about != nullptr && about->isVisible())
            found.push_back(about);
    }
    return found;
}

void ExpectFrame(const AboutView& view, const QString& text, int size, int smear)
{
    QString where;
    const QImage reference = ReferenceAboutFrame(text, size, smear, view.size());
    EXPECT_EQ(DifferingPixels(view.Frame(), reference, &where), 0)
        << "\"" << text.toStdString() << "\" at smear " << smear << ", first at " << where.toStdString();
}

// --- The window ------------------------------------------------------------

TEST(AboutWindow, IsA400By50FramelessModalWindowCentredOnItsScreen)
{
    ManualAbout about;
    AboutWindow& window = *about.window;
    EXPECT_TRUE(window.isVisible());
    EXPECT_EQ(window.size(), QSize(400, 50));
    EXPECT_EQ(window.windowTitle(), "About Window");
    EXPECT_TRUE(window.windowFlags().testFlag(Qt::FramelessWindowHint));
    EXPECT_EQ(window.windowModality(), Qt::ApplicationModal);
    const QRect screen = window.screen()->geometry();
    const QRect frame = window.geometry();
    EXPECT_EQ(frame.left() - screen.left(), screen.right() - frame.right());
    EXPECT_EQ(frame.top() - screen.top(), screen.bottom() - frame.bottom());
    EXPECT_EQ(about.View().geometry(), QRect(0, 0, 400, 50));
}

TEST(AboutWindow, CentresOnAnyScreenFrame)
{
    EXPECT_EQ(AboutWindow::CentredOn(QRect(0, 0, 1024, 768)), QPoint(312, 359));
    EXPECT_EQ(AboutWindow::CentredOn(QRect(0, 0, 1280, 1024)), QPoint(440, 487));
    EXPECT_EQ(AboutWindow::CentredOn(QRect(1920, 100, 1280, 1024)), QPoint(1920 + 440, 100 + 487));
}

TEST(AboutWindow, AClickInAnyPhaseClosesAndDeletesIt)
{
    // Condensing, holding, dissolving, and right after the switch to the
    // next line.
    for (int phase = 0; phase < 4; ++phase) {
        ManualAbout about;
        about.log.Fire();
        if (phase >= 1)
            about.FramesUntilPhaseEnds();
        if (phase >= 2) {
            about.log.Fire();
            about.log.Fire();
        }
        if (phase >= 3) {
            about.FramesUntilPhaseEnds();
            about.log.Fire();
        }
        QTest::mouseClick(&about.View(), Qt::LeftButton, {}, QPoint(300, 10));
        Drain();
        EXPECT_TRUE(about.window.isNull()) << "phase " << phase;
    }
}

TEST(AboutWindow, TheAboutItemOpensOneThroughTheApplication)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    QAction* item = nullptr;
    for (QAction* action : window->menuBar()->findChildren<QAction*>()) {
        if (action->text() == "About")
            item = action;
    }
    ASSERT_NE(item, nullptr);
    item->trigger();
    Drain();
    std::vector<AboutWindow*> open = OpenAboutWindows();
    ASSERT_EQ(open.size(), 1u);
    QPointer<AboutWindow> about = open[0];
    QTest::mouseClick(about->View(), Qt::LeftButton);
    Drain();
    EXPECT_TRUE(about.isNull());
    EXPECT_TRUE(OpenAboutWindows().empty());
}

// --- The animation -----------------------------------------------------------

TEST(AboutView, StartsWithTheTitleAndAsksForFramesAtOnce)
{
    ManualAbout about;
    EXPECT_EQ(about.View().Text(), kTitle);
    EXPECT_EQ(about.View().FontSize(), 16);
    EXPECT_TRUE(about.View().Font().bold());
    EXPECT_EQ(about.View().Smear(), 254);
    EXPECT_EQ(about.View().Step(), -2);
    EXPECT_EQ(about.View().LineIndex(), -1);
    EXPECT_EQ(about.log.what, kMsgAboutDraw);
    EXPECT_EQ(about.log.intervalMicros, 100);
}

TEST(AboutView, FirstFrameIsTheTitleDimAndWideAtSmear252)
{
    ManualAbout about;
    about.log.Fire();
    EXPECT_EQ(about.View().Smear(), 252);
    ExpectFrame(about.View(), kTitle, 16, 252);
    // Dim: grey 3 per copy, and the light spreads over more than 252 columns.
    int lit = 0;
    for (int x = 0; x < 400; ++x) {
        for (int y = 0; y < 50; ++y) {
            if (qRed(about.View().Frame().pixel(x, y)) > 0) {
                ++lit;
                break;
            }
        }
    }
    EXPECT_GT(lit, 252);
}

TEST(AboutView, IsSharpAfter127FramesThenHoldsFiveSeconds)
{
    ManualAbout about;
    for (int frame = 1; frame <= 126; ++frame)
        about.log.Fire();
    EXPECT_EQ(about.View().Smear(), 2);
    EXPECT_EQ(about.log.what, kMsgAboutDraw);
    about.log.Fire();
    EXPECT_EQ(about.View().Smear(), 0);
    EXPECT_EQ(about.View().Step(), 2);
    EXPECT_EQ(about.log.what, kMsgAboutWait);
    EXPECT_EQ(about.log.intervalMicros, 5000000);
    ExpectFrame(about.View(), kTitle, 16, 0);
    // White at the letters' cores.
    int white = 0;
    for (int y = 0; y < 50; ++y) {
        for (int x = 0; x < 400; ++x)
            white += qRed(about.View().Frame().pixel(x, y)) == 255 ? 1 : 0;
    }
    EXPECT_GT(white, 20);
    // After the hold the line dissolves, a frame at a time.
    about.log.Fire();
    EXPECT_EQ(about.log.what, kMsgAboutDraw);
    EXPECT_EQ(about.log.intervalMicros, 100);
    about.log.Fire();
    EXPECT_EQ(about.View().Smear(), 2);
    ExpectFrame(about.View(), kTitle, 16, 2);
}

TEST(AboutView, DissolvesIn127FramesThenTakesTheSubtitle)
{
    ManualAbout about;
    EXPECT_EQ(about.FramesUntilPhaseEnds(), 127);
    about.log.Fire();
    EXPECT_EQ(about.FramesUntilPhaseEnds(), 127);
    EXPECT_EQ(about.View().Smear(), 254);
    EXPECT_EQ(about.View().Step(), -2);
    EXPECT_EQ(about.log.what, kMsgAboutNext);
    EXPECT_EQ(about.log.intervalMicros, 100);
    about.log.Fire();
    EXPECT_EQ(about.View().Text(), "waveform editing  for  Linux");
    EXPECT_EQ(about.View().FontSize(), 11);
    EXPECT_EQ(about.View().LineIndex(), 0);
    EXPECT_EQ(about.log.what, kMsgAboutDraw);
    about.log.Fire();
    ExpectFrame(about.View(), "waveform editing  for  Linux", 11, 252);
}

TEST(AboutView, LinesFollowInTheirOrderAndSizes)
{
    ManualAbout about;
    struct Expected {
        const char* text;
        int size;
        int index;
    };
    const Expected lines[] = {
        {"waveform editing  for  Linux", 11, 0},
        {"by", 9, 1},
        {"Glimmet  developers", 12, 2},
        {"and", 9, 3},
        {"all  contributors", 12, 4},
        {"", 12, 5},
        {"G l i m m e t", 16, -1},
        {"waveform editing  for  Linux", 11, 0},
    };
    for (const Expected& line : lines) {
        about.RunLine();
        EXPECT_EQ(about.View().Text(), line.text);
        EXPECT_EQ(about.View().FontSize(), line.size) << line.text;
        EXPECT_EQ(about.View().LineIndex(), line.index) << line.text;
    }
}

TEST(AboutView, CreditLinesAreTwoWordsTwoBlanksApart)
{
    for (int index : {1, 3}) {
        const QString credit = QString::fromLatin1(AboutView::LineAfter(index).text);
        const QStringList words = credit.split(QStringLiteral("  "));
        ASSERT_EQ(words.size(), 2) << credit.toStdString();
        EXPECT_FALSE(words[0].contains(' '));
        EXPECT_FALSE(words[1].contains(' '));
    }
}

TEST(AboutView, ThePauseLineShowsNothingAndTheTitleFollowsAtSize16)
{
    ManualAbout about;
    for (int line = 0; line < 6; ++line)
        about.RunLine();
    ASSERT_EQ(about.View().Text(), "");
    QImage black(400, 50, QImage::Format_RGB32);
    black.fill(Qt::black);
    int frames = 0;
    while (about.log.what == kMsgAboutDraw) {
        about.log.Fire();
        ++frames;
        ASSERT_EQ(DifferingPixels(about.View().Frame(), black), 0) << "frame " << frames;
    }
    EXPECT_EQ(frames, 127);
    about.log.Fire();
    about.FramesUntilPhaseEnds();
    about.log.Fire();
    EXPECT_EQ(about.View().Text(), kTitle);
    EXPECT_EQ(about.View().FontSize(), 16);
    about.log.Fire();
    EXPECT_EQ(about.View().Smear(), 252);
    ExpectFrame(about.View(), kTitle, 16, 252);
    // The same picture as the very first frame of a new box.
    ManualAbout fresh;
    fresh.log.Fire();
    EXPECT_EQ(DifferingPixels(about.View().Frame(), fresh.View().Frame()), 0);
}

TEST(AboutView, TheScreenShowsTheLastFrame)
{
    ManualAbout about;
    for (int frame = 0; frame < 127; ++frame)
        about.log.Fire();
    const QImage shown = about.View().grab().toImage().convertToFormat(QImage::Format_RGB32);
    EXPECT_EQ(DifferingPixels(shown, about.View().Frame()), 0);
}

// --- Pacing --------------------------------------------------------------------

TEST(AboutPacing, FramesComeAtMostAHundredTimesASecond)
{
    PacedRunner runner;
    EXPECT_EQ(runner.FramePeriodMicros(), 10000);
    runner.Replace(kMsgAboutDraw, 100);
    EXPECT_EQ(runner.IntervalMillis(), 10);
    runner.Replace(kMsgAboutWait, 5000000);
    EXPECT_EQ(runner.IntervalMillis(), 5000);
    EXPECT_EQ(PacedRunner::FramePeriodFor(nullptr), 10000);
    PacedRunner sixty(PacedRunner::FramePeriodFor(QGuiApplication::primaryScreen()));
    EXPECT_GE(sixty.FramePeriodMicros(), 10000);
}

TEST(AboutPacing, TheAnimationDoesNotRunFlatOut)
{
    // A short real run: a frame every 100 microseconds would be hundreds of
    // frames in this time; the paced box draws a few dozen at most.
    auto* window = new AboutWindow(std::make_unique<PacedRunner>());
    QPointer<AboutWindow> about = window;
    QElapsedTimer clock;
    clock.start();
    QTest::qWait(300);
    const qint64 elapsed = clock.elapsed();
    const int frames = (254 - about->View()->Smear()) / 2;
    EXPECT_GT(frames, 0);
    EXPECT_LE(frames, elapsed / 10 + 2);
    delete window;
}

}  // namespace
}  // namespace glimmet::test
