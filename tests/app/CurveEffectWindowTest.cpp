#include <gtest/gtest.h>

#include <QMenuBar>
#include <QPointer>
#include <QPushButton>
#include <QTest>

#include <cmath>
#include <vector>

#include "AppTestSupport.h"
#include "app/DialogScriptCommands.h"
#include "edit/Action.h"
#include "edit/HistoryManager.h"
#include "edit/dialogs/CurveParameterWindow.h"
#include "edit/dialogs/FParameterWindow.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "views/SplineControl.h"
#include "sound/ChannelSamples.h"

namespace glimmet::test {
namespace {

QAction* ToolsItem(QuillexWindow* window, const QString& label)
{
    for (QAction* top : window->menuBar()->actions()) {
        if (top->text() != "Tools")
            continue;
        for (QAction* item : top->menu()->actions()) {
            if (item->text() == label)
                return item;
        }
    }
    return nullptr;
}

/// A loaded stereo window with both channels selected over frames 10..89.
QuillexWindow* EditableWindow(AppFixture& fixture, const char* name = "curve.wav")
{
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound(name, 2, 100));
    window->PostMessage(kMsgSelectAll);
    Drain();
    window->Manager()->SetRangeStart(10);
    window->Manager()->SetRangeEnd(89);
    return window;
}

std::vector<int16_t> Samples(QuillexWindow* window, int32_t channel)
{
    return test::SamplesOf(*window->Manager()->ChannelAt(channel));
}

/// The control pixel of a normalised point.
QPoint PixelOf(SplineControl* control, double x, double y)
{
    const QPointF position = control->ViewPosition(QPointF(x, y));
    return QPoint(int(std::lround(position.x())), int(std::lround(position.y())));
}

TEST(CurveEffectWindowTest, EachToolsItemOpensItsDialogAndWaits)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture);
    const std::vector<std::pair<QString, QString>> items = {{"FIR Filter\u2026", "FIR Filter"},
        {"Distort\u2026", "Distort"}, {"Peak Distort\u2026", "Peak Distort"}, {"Envelope\u2026", "Envelope"}};
    for (const auto& [label, title] : items) {
        QAction* item = ToolsItem(window, label);
        ASSERT_NE(item, nullptr) << label.toStdString();
        item->trigger();
        Drain();
        CurveParameterWindow* dialog = DialogScriptCommands::OpenDialog(window);
        ASSERT_NE(dialog, nullptr) << label.toStdString();
        EXPECT_EQ(dialog->windowTitle(), title);
        EXPECT_EQ(dialog->parentWidget(), window);
        ASSERT_NE(window->PendingAction(), nullptr);
        EXPECT_EQ(window->History()->UndoName(), nullptr) << "nothing runs before Ok";
        QPointer<CurveParameterWindow> watch(dialog);
        QTest::mouseClick(dialog->CancelButton(), Qt::LeftButton);
        Drain();
        EXPECT_EQ(window->PendingAction(), nullptr);
        EXPECT_TRUE(watch.isNull()) << "the cancelled action takes its dialog with it";
        EXPECT_EQ(window->History()->UndoName(), nullptr);
    }
}

TEST(CurveEffectWindowTest, DrawnCurveOkUndoRedoThroughTheWindow)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture);
    const std::vector<int16_t> before = Samples(window, 1);
    ToolsItem(window, "Distort\u2026")->trigger();
    Drain();
    CurveParameterWindow* dialog = DialogScriptCommands::OpenDialog(window);
    ASSERT_NE(dialog, nullptr);
    SplineControl* control = dialog->Control();
    // Pull the right end up to the top: every magnitude maps to at least
    // what it was.
    QTest::mousePress(control, Qt::LeftButton, {}, PixelOf(control, 1.0, 0.0));
    QTest::mouseMove(control, PixelOf(control, 1.0, 0.5));
    QTest::mouseRelease(control, Qt::LeftButton, {}, PixelOf(control, 1.0, 0.5));
    ASSERT_EQ(control->ControlPoints().size(), 2u);
    EXPECT_EQ(control->ControlPoints()[1].x(), 1.0) << "an end point moves only up and down";
    EXPECT_NEAR(control->ControlPoints()[1].y(), 0.5, 0.05);
    const effects::SplineCurve curve = control->Curve();
    QTest::mouseClick(dialog->OkButton(), Qt::LeftButton);
    Drain();
    EXPECT_STREQ(window->History()->UndoName(), "Distortion");
    EXPECT_TRUE(dialog->isHidden()) << "kept, hidden, for redo";
    const std::vector<int16_t> distorted = Samples(window, 1);
    for (size_t i = 0; i < before.size(); i++) {
        int16_t expected = before[i];
        if (i >= 10 && i <= 89) {
            const double s = before[i];
            const double v = s < 0 ? std::trunc((1.0 - curve(std::fabs(s / 32768.0))) * -32768.0)
                                   : std::trunc(32767.0 * (1.0 - curve(std::fabs(s / 32767.0))));
            expected = v < -32768 || v > 32767 ? int16_t(32767) : int16_t(v);
        }
        EXPECT_EQ(distorted[i], expected) << i;
    }
    window->PostMessage(kMsgUndo);
    Drain();
    EXPECT_EQ(Samples(window, 1), before);
    window->PostMessage(kMsgRedo);
    Drain();
    EXPECT_EQ(Samples(window, 1), distorted);
}

TEST(CurveEffectWindowTest, TheCloseBoxCancelsAndOkWithoutAnActionDoesNothing)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture);
    const std::vector<int16_t> before = Samples(window, 0);
    window->PostMessage(kMsgFilter);
    Drain();
    QPointer<CurveParameterWindow> dialog = DialogScriptCommands::OpenDialog(window);
    ASSERT_FALSE(dialog.isNull());
    dialog->close();
    Drain();
    EXPECT_TRUE(dialog.isNull());
    EXPECT_EQ(window->PendingAction(), nullptr);
    window->PostMessage(kMsgActionGo);
    Drain();
    EXPECT_EQ(window->History()->UndoName(), nullptr);
    EXPECT_EQ(Samples(window, 0), before);
}

TEST(CurveEffectWindowTest, FirRedoFiltersWithTheKeptKernelAfterItsDialogIsGone)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture);
    const std::vector<int16_t> before = Samples(window, 0);
    window->PostMessage(kMsgFilter);
    Drain();
    auto* dialog = qobject_cast<FParameterWindow*>(DialogScriptCommands::OpenDialog(window));
    ASSERT_NE(dialog, nullptr);
    QPointer<FParameterWindow> watch(dialog);
    QTest::mouseClick(dialog->Control(), Qt::LeftButton, {}, PixelOf(dialog->Control(), 0.5, 0.1));
    ASSERT_EQ(dialog->Control()->ControlPoints().size(), 3u);
    QTest::keyClick(dialog->OkButton(), Qt::Key_Return);
    QTest::mouseClick(dialog->OkButton(), Qt::LeftButton);
    Drain();
    EXPECT_TRUE(watch.isNull()) << "the first run closes the FIR dialog";
    const std::vector<int16_t> filtered = Samples(window, 0);
    EXPECT_NE(filtered, before);
    window->PostMessage(kMsgUndo);
    Drain();
    EXPECT_EQ(Samples(window, 0), before);
    window->PostMessage(kMsgRedo);
    Drain();
    EXPECT_EQ(Samples(window, 0), filtered);
}

TEST(CurveEffectWindowTest, EachWindowHasItsOwnDialog)
{
    AppFixture fixture;
    QuillexWindow* first = EditableWindow(fixture, "one.wav");
    QuillexWindow* second = EditableWindow(fixture, "two.wav");
    first->PostMessage(kMsgEnvelope);
    Drain();
    EXPECT_NE(DialogScriptCommands::OpenDialog(first), nullptr);
    EXPECT_EQ(DialogScriptCommands::OpenDialog(second), nullptr);
    // The other window edits on while the first one's dialog is open.
    second->PostMessage(kMsgFadeIn);
    Drain();
    EXPECT_STREQ(second->History()->UndoName(), "Fade In");
    QTest::mouseClick(DialogScriptCommands::OpenDialog(first)->OkButton(), Qt::LeftButton);
    Drain();
    EXPECT_STREQ(first->History()->UndoName(), "Envelope");
    EXPECT_STREQ(second->History()->UndoName(), "Fade In");
}

}  // namespace
}  // namespace glimmet::test
