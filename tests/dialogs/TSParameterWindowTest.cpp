#include <gtest/gtest.h>

#include <QApplication>
#include <QLabel>
#include <QLineEdit>
#include <QPointer>
#include <QPushButton>
#include <QTest>
#include <QWidget>

#include <memory>

#include "app/PostedMessages.h"
#include "edit/dialogs/TSDialogLink.h"
#include "edit/dialogs/TSParameterWindow.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

using test::PostedMessages;

void DrainEvents()
{
    for (int i = 0; i < 5; i++) {
        QCoreApplication::sendPostedEvents();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        QCoreApplication::processEvents();
    }
}

TEST(TSParameterWindowTest, TitleFieldsInOrderAndButtons)
{
    QWidget window;
    PostedMessages target;
    auto* dialog = new TSParameterWindow(&window, &target);
    EXPECT_EQ(dialog->windowTitle(), "Time Stretch");
    EXPECT_EQ(dialog->windowModality(), Qt::WindowModal);
    EXPECT_EQ(dialog->parentWidget(), &window);
    const char* labels[] = {"FFT length:", "Window size in samples:", "Decimation factor in samples:",
        "Interpolation factor in samples:", "Stretch factor:", "Oscillator bank pitch factor:",
        "Oscillator resynthesis gate threshold:"};
    const char* texts[] = {"8192", "8192", "2048", "2048", "2.0", "0.0", "0.0"};
    for (int i = 0; i < TSParameterWindow::kFieldCount; i++) {
        EXPECT_EQ(TSParameterWindow::Labels()[size_t(i)], labels[i]);
        EXPECT_EQ(dialog->Field(i)->text(), texts[i]) << labels[i];
        EXPECT_EQ(dialog->FieldLabelled(labels[i]), dialog->Field(i));
    }
    // The labels on screen, in the fields' order, each naming its field.
    const QList<QLabel*> shown = dialog->findChildren<QLabel*>();
    ASSERT_EQ(shown.size(), TSParameterWindow::kFieldCount);
    for (int i = 0; i < TSParameterWindow::kFieldCount; i++) {
        EXPECT_EQ(shown[i]->text(), labels[i]);
        EXPECT_EQ(shown[i]->buddy(), dialog->Field(i));
    }
    EXPECT_EQ(dialog->FieldLabelled("Nonsense:"), nullptr);
    EXPECT_EQ(dialog->CancelButton()->text(), "Cancel");
    EXPECT_EQ(dialog->OkButton()->text(), "Ok");
    EXPECT_TRUE(dialog->OkButton()->isDefault());
    EXPECT_FALSE(dialog->CancelButton()->isDefault());
}

TEST(TSParameterWindowTest, DefaultsReadAsTheirValues)
{
    TSParameterWindow dialog(nullptr, nullptr);
    int32_t n, d, dec, in;
    float s, p, g;
    dialog.GetParameters(&n, &d, &dec, &in, &s, &p, &g);
    EXPECT_EQ(n, 8192);
    EXPECT_EQ(d, 8192);
    EXPECT_EQ(dec, 2048);
    EXPECT_EQ(in, 2048);
    EXPECT_EQ(s, 2.0f);
    EXPECT_EQ(p, 0.0f);
    EXPECT_EQ(g, 0.0f);
}

TEST(TSParameterWindowTest, TextsParseAsStrtolAndStrtod)
{
    EXPECT_EQ(TSParameterWindow::ParseInteger("12abc"), 12);
    EXPECT_EQ(TSParameterWindow::ParseInteger("abc"), 0);
    EXPECT_EQ(TSParameterWindow::ParseInteger("  -42"), -42);
    EXPECT_EQ(TSParameterWindow::ParseInteger("0x10"), 0);
    EXPECT_EQ(TSParameterWindow::ParseInteger("010"), 10);
    EXPECT_EQ(TSParameterWindow::ParseInteger(""), 0);
    EXPECT_EQ(TSParameterWindow::ParseFloat("1.5x"), 1.5f);
    EXPECT_EQ(TSParameterWindow::ParseFloat("abc"), 0.0f);
    EXPECT_EQ(TSParameterWindow::ParseFloat(" 2e1"), 20.0f);
    EXPECT_EQ(TSParameterWindow::ParseFloat("0.1"), float(0.1));
    TSParameterWindow dialog(nullptr, nullptr);
    dialog.Field(0)->setText("4096 samples");
    dialog.Field(4)->setText("1,5");
    const StretchParameters p = dialog.Parameters();
    EXPECT_EQ(p.fftLength, 4096);
    EXPECT_EQ(p.stretch, 1.0f);
}

TEST(TSParameterWindowTest, OkCancelCloseBoxAndEscapeAnswerTheWindow)
{
    QWidget window;
    PostedMessages target;
    auto* dialog = new TSParameterWindow(&window, &target);
    window.show();
    dialog->ShowAtHome();
    QTest::mouseClick(dialog->OkButton(), Qt::LeftButton);
    QTest::mouseClick(dialog->CancelButton(), Qt::LeftButton);
    EXPECT_FALSE(dialog->close()) << "the close box only asks";
    QTest::keyClick(dialog, Qt::Key_Escape);
    EXPECT_TRUE(dialog->isVisible());
    QTest::keyClick(dialog->Field(2), Qt::Key_Return);
    EXPECT_EQ(target.codes, (std::vector<uint32_t>{kMsgActionGo, kMsgActionCancel, kMsgActionCancel,
                                 kMsgActionCancel, kMsgActionGo}));
}

TEST(TSParameterWindowTest, WiderButNotTaller)
{
    QWidget window;
    auto* dialog = new TSParameterWindow(&window, nullptr);
    dialog->ShowAtHome();
    EXPECT_EQ(dialog->minimumHeight(), dialog->maximumHeight());
    EXPECT_GT(dialog->maximumWidth(), dialog->width());
    EXPECT_EQ(dialog->pos(), QPoint(200, 200));
}

TEST(TSDialogLinkTest, ReadsAndClosesItsDialog)
{
    QWidget window;
    auto* dialog = new TSParameterWindow(&window, nullptr);
    QPointer<TSParameterWindow> watch(dialog);
    dialog->Field(4)->setText("1.25");
    {
        TSDialogLink link(dialog);
        ASSERT_TRUE(link.Lock());
        EXPECT_EQ(link.GetParameters().stretch, 1.25f);
        link.Unlock();
    }
    DrainEvents();
    EXPECT_TRUE(watch.isNull()) << "the link closes its dialog when it ends";
}

TEST(TSDialogLinkTest, ADialogTakenAwayWithItsWindowCannotBeRead)
{
    auto window = std::make_unique<QWidget>();
    TSDialogLink link(new TSParameterWindow(window.get(), nullptr));
    window.reset();
    EXPECT_FALSE(link.Lock());
    EXPECT_EQ(link.GetParameters().fftLength, 0);
}

}  // namespace
}  // namespace glimmet
