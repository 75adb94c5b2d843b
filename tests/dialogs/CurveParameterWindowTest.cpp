#include <gtest/gtest.h>

#include <QApplication>
#include <QCloseEvent>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QTest>
#include <QWidget>

#include <cmath>
#include <functional>
#include <memory>

#include "app/PostedMessages.h"
#include "edit/dialogs/CParameterWindow.h"
#include "edit/dialogs/CurveDialogLink.h"
#include "edit/dialogs/DParameterWindow.h"
#include "edit/dialogs/EParameterWindow.h"
#include "edit/dialogs/FParameterWindow.h"
#include "edit/dialogs/SpinButton.h"
#include "support/MessageCodes.h"
#include "views/SplineControl.h"

namespace glimmet {
namespace {

using test::PostedMessages;

struct DialogCase {
    const char* title;
    const char* controlName;
    const char* firstLabel;
    const char* secondLabel;
    double y0;
    double y1;
    std::function<CurveParameterWindow*(QWidget*, MessageTarget*)> make;
};

template <typename T>
std::function<CurveParameterWindow*(QWidget*, MessageTarget*)> Maker()
{
    return [](QWidget* parent, MessageTarget* target) { return new T(parent, target); };
}

std::vector<DialogCase> AllDialogs()
{
    return {
        {"FIR Filter", "filter func", "Filter Function", "1.0", double(0.85f), 1.0, Maker<FParameterWindow>()},
        {"Distort", "compressor", "Aplitudes", "Gain", 1.0, 0.0, Maker<DParameterWindow>()},
        {"Peak Distort", "compressor", "Local Peak", "Gain", 1.0, 0.0, Maker<CParameterWindow>()},
        {"Envelope", "envelope", "Selection", "400%", 0.75, 0.75, Maker<EParameterWindow>()},
    };
}

void Drain()
{
    for (int i = 0; i < 5; i++) {
        QCoreApplication::sendPostedEvents();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        QCoreApplication::processEvents();
    }
}

TEST(CurveParameterWindowTest, EachDialogHasItsTextsAndStartingCurve)
{
    for (const DialogCase& entry : AllDialogs()) {
        QWidget window;
        PostedMessages target;
        CurveParameterWindow* dialog = entry.make(&window, &target);
        dialog->ShowAtHome();
        EXPECT_EQ(dialog->windowTitle(), entry.title);
        EXPECT_EQ(dialog->Control()->objectName(), entry.controlName);
        EXPECT_EQ(dialog->Control()->FirstLabel(), entry.firstLabel);
        EXPECT_EQ(dialog->Control()->SecondLabel(), entry.secondLabel);
        ASSERT_EQ(dialog->Control()->ControlPoints().size(), 2u);
        EXPECT_EQ(dialog->Control()->ControlPoints()[0], QPointF(0.0, entry.y0)) << entry.title;
        EXPECT_EQ(dialog->Control()->ControlPoints()[1], QPointF(1.0, entry.y1)) << entry.title;
        EXPECT_EQ(dialog->OkButton()->text(), "Ok");
        EXPECT_EQ(dialog->CancelButton()->text(), "Cancel");
        EXPECT_TRUE(dialog->OkButton()->isDefault());
        EXPECT_FALSE(dialog->CancelButton()->isDefault());
        // Modal for its own document window only.
        EXPECT_EQ(dialog->windowModality(), Qt::WindowModal);
        EXPECT_EQ(dialog->parentWidget(), &window);
        EXPECT_FALSE(dialog->windowFlags().testFlag(Qt::WindowMaximizeButtonHint));
        EXPECT_TRUE(dialog->isVisible());
        EXPECT_EQ(dialog->pos(), QPoint(200, 200));
        EXPECT_GE(dialog->width(), dialog->minimumSizeHint().width());
        // Cancel is left of Ok.
        EXPECT_LT(dialog->CancelButton()->x(), dialog->OkButton()->x());
    }
}

TEST(CurveParameterWindowTest, ButtonsCloseBoxAndEscapeAnswerTheWindow)
{
    for (const DialogCase& entry : AllDialogs()) {
        QWidget window;
        PostedMessages target;
        CurveParameterWindow* dialog = entry.make(&window, &target);
        dialog->ShowAtHome();
        QTest::mouseClick(dialog->OkButton(), Qt::LeftButton);
        QTest::mouseClick(dialog->CancelButton(), Qt::LeftButton);
        EXPECT_FALSE(dialog->close()) << "the close box only asks";
        EXPECT_TRUE(dialog->isVisible());
        QTest::keyClick(dialog, Qt::Key_Escape);
        EXPECT_TRUE(dialog->isVisible()) << "Escape only asks too";
        EXPECT_EQ(target.codes,
            (std::vector<uint32_t>{kMsgActionGo, kMsgActionCancel, kMsgActionCancel, kMsgActionCancel}))
            << entry.title;
    }
}

TEST(CurveParameterWindowTest, EnterIsOk)
{
    QWidget window;
    PostedMessages target;
    auto* dialog = new FParameterWindow(&window, &target);
    dialog->ShowAtHome();
    QTest::keyClick(dialog->PassesField(), Qt::Key_Return);
    EXPECT_EQ(target.codes, std::vector<uint32_t>{kMsgActionGo});
}

TEST(CurveParameterWindowTest, ValueAtIsTheHeightOfTheCurve)
{
    QWidget window;
    FParameterWindow filter(&window, nullptr);
    EXPECT_DOUBLE_EQ(filter.ValueAt(0.0), 1.0 - double(0.85f));
    EXPECT_EQ(filter.ValueAt(1.0), 0.0);
    EXPECT_EQ(filter.ValueAt(1.5), 1.0) << "outside the curve the control gives 0";
    DParameterWindow distort(&window, nullptr);
    EXPECT_EQ(distort.ValueAt(0.25), 0.25);
    // The envelope's flat start is a gain of exactly 1.
    EParameterWindow envelope(&window, nullptr);
    for (double x : {0.0, 0.3, 0.999})
        EXPECT_EQ(envelope.ValueAt(x), 1.0);
    EXPECT_EQ(envelope.ValueAt(-1.0), 4.0);
}

TEST(CurveParameterWindowTest, PassesStartAtTenAndAreTruncatedTowardZero)
{
    QWidget window;
    FParameterWindow dialog(&window, nullptr);
    EXPECT_EQ(dialog.NumPasses(), 10);
    EXPECT_EQ(dialog.PassesField()->text(), "10");
    auto* label = dialog.findChild<QLabel*>();
    ASSERT_NE(label, nullptr);
    EXPECT_EQ(label->text(), "Filter passes:");
    const std::vector<std::pair<double, int32_t>> cases = {
        {10.9, 10}, {-2.7, -2}, {0.4, 0}, {-0.9, 0}, {1e6, 1000000}, {2147483647.0, 2147483647}, {-5e12, INT32_MIN}};
    for (const auto& [value, passes] : cases) {
        dialog.PassesField()->setValue(value);
        EXPECT_EQ(dialog.NumPasses(), passes) << value;
    }
    // Typed, as a user does: digits, a sign and a point.
    dialog.PassesField()->selectAll();
    QTest::keyClicks(dialog.PassesField(), "-3.5");
    EXPECT_EQ(dialog.NumPasses(), -3);
    EXPECT_EQ(DParameterWindow(&window, nullptr).NumPasses(), 0);
}

TEST(CurveDialogLinkTest, ReadsHidesAndClosesItsDialog)
{
    QWidget window;
    auto* dialog = new EParameterWindow(&window, nullptr);
    dialog->ShowAtHome();
    QPointer<EParameterWindow> watch(dialog);
    {
        CurveDialogLink link(dialog);
        ASSERT_TRUE(link.Lock());
        EXPECT_EQ(link.Curve()(0.5), 0.75);
        EXPECT_EQ(link.NumPasses(), 0);
        link.Unlock();
        EXPECT_FALSE(link.IsHidden());
        link.Hide();
        EXPECT_TRUE(link.IsHidden());
        EXPECT_TRUE(link.Lock()) << "a hidden dialog is still there to read";
    }
    EXPECT_FALSE(dialog->isVisible());
    Drain();
    EXPECT_TRUE(watch.isNull()) << "the link closes its dialog when it ends";
}

TEST(CurveDialogLinkTest, ADialogTakenAwayWithItsWindowCannotBeRead)
{
    auto window = std::make_unique<QWidget>();
    auto* dialog = new FParameterWindow(window.get(), nullptr);
    CurveDialogLink link(dialog);
    EXPECT_EQ(link.NumPasses(), 10);
    window.reset();
    EXPECT_FALSE(link.Lock());
    EXPECT_TRUE(link.IsHidden());
    EXPECT_EQ(link.NumPasses(), 0);
    link.Hide();
    link.Quit();
}

TEST(CurveDialogLinkTest, QuitClosesForGood)
{
    QWidget window;
    auto* dialog = new FParameterWindow(&window, nullptr);
    dialog->ShowAtHome();
    QPointer<FParameterWindow> watch(dialog);
    CurveDialogLink link(dialog);
    link.Quit();
    EXPECT_FALSE(link.Lock());
    EXPECT_FALSE(dialog->isVisible());
    Drain();
    EXPECT_TRUE(watch.isNull());
}

}  // namespace
}  // namespace glimmet
