#include <gtest/gtest.h>

#include <QApplication>
#include <QFileDialog>
#include <QLineEdit>
#include <QMessageBox>
#include <QPushButton>
#include <QTest>
#include <QTimer>

#include <algorithm>
#include <vector>

#include "AppTestSupport.h"
#include "app/MenuTable.h"
#include "edit/HistoryManager.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"
#include "views/ChannelContainerView.h"

namespace glimmet::test {
namespace {

TEST(QuillexWindow, SaveOnAnUntitledDocumentAsksWhereWithSoundWav)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    EXPECT_EQ(window->SavePanel(), nullptr);
    window->PostMessage(kMsgSave);
    Drain();
    QFileDialog* panel = window->SavePanel();
    ASSERT_NE(panel, nullptr);
    EXPECT_TRUE(panel->isVisible());
    EXPECT_EQ(panel->acceptMode(), QFileDialog::AcceptSave);
    auto* nameField = panel->findChild<QLineEdit*>("fileNameEdit");
    ASSERT_NE(nameField, nullptr);
    EXPECT_EQ(nameField->text(), "sound.wav");

    // Loaded content, then the user picks a name in the panel.
    const auto source = fixture.MakeSound("source.wav", 1, 2500);
    window->SetAppendOnLoad(true);
    window->SetTo(source);
    window->SetFileEntry(std::nullopt);
    const std::filesystem::path target = fixture.Dir() / "chosen.wav";
    emit panel->fileSelected(QString::fromStdString(target.string()));
    Drain();
    EXPECT_EQ(window->windowTitle(), "Glimmet - chosen.wav");
    EXPECT_EQ(window->FileEntry(), target);
    const auto saved = ReadWav(target);
    ASSERT_EQ(saved.size(), 2u);
    EXPECT_EQ(saved[0].size(), 2500u);
    EXPECT_FALSE(window->MenuItem(KeptMenuItem::Save)->isEnabled());
}

TEST(QuillexWindow, SaveAsShowsThePanelAgainAndSaveWithAFileWritesIt)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("doc.wav", 1, 300);
    QuillexWindow* window = OpenWindow(fixture, file);
    window->PostMessage(kMsgSaveAs);
    Drain();
    ASSERT_NE(window->SavePanel(), nullptr);
    QFileDialog* first = window->SavePanel();
    first->hide();
    window->PostMessage(kMsgSaveAs);
    Drain();
    EXPECT_EQ(window->SavePanel(), first);
    EXPECT_TRUE(first->isVisible());
    first->hide();

    std::filesystem::remove(file);
    window->PostMessage(kMsgSave);
    Drain();
    const auto saved = ReadWav(file);
    ASSERT_EQ(saved.size(), 2u);
    EXPECT_EQ(saved[0].size(), 300u);
}

TEST(QuillexWindow, SavePanelChoiceNeedsBothFieldsAndAnExistingFolder)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    Message noName(kMsgSavePanelChoice);
    noName.AddPath("directory", fixture.Dir());
    window->PostMessage(noName);
    Message badFolder(kMsgSavePanelChoice);
    badFolder.AddPath("directory", fixture.Dir() / "missing");
    badFolder.AddString("name", "x.wav");
    window->PostMessage(badFolder);
    Drain();
    EXPECT_FALSE(window->FileEntry().has_value());
    EXPECT_EQ(window->windowTitle(), "Glimmet");
    EXPECT_FALSE(std::filesystem::exists(fixture.Dir() / "missing"));
}

TEST(QuillexWindow, SaveFailurePrintsTheError)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    window->SetFileEntry(fixture.Dir() / "no-such-folder" / "x.wav");
    DiagnosticsCapture capture;
    window->MessageReceived(Message(kMsgSave));
    const std::string output = capture.Finish();
    EXPECT_NE(output.find("error writing file. ("), std::string::npos) << output;
    EXPECT_EQ(output.back(), '\n');
}

TEST(QuillexWindow, ClosingAnEditedUntitledDocumentClosesWithoutAQuestion)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    QuillexWindow* window = OpenWindow(fixture);
    MakeUnsaved(window);
    window->PostMessage(kMsgQuitRequested);
    Drain();
    EXPECT_FALSE(IsListed(fixture, window));
    EXPECT_EQ(fixture.App().CountWindows(), 1);
}

TEST(QuillexWindow, TheCloseBoxAsksLikeClose)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    QuillexWindow* window = OpenWindow(fixture);
    EXPECT_FALSE(window->close());  // refused at once, handled by the application
    Drain();
    EXPECT_FALSE(IsListed(fixture, window));
}

class CloseLoadedDocument : public testing::TestWithParam<int> {};

TEST_P(CloseLoadedDocument, AnswersDecideWhatHappens)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    const auto file = fixture.MakeSound("loaded.wav", 1, 200);
    QuillexWindow* window = OpenWindow(fixture, file);
    window->ContainerView()->SelectAll();
    window->PostMessage(kMsgMaximize);
    Drain();
    ASSERT_FALSE(window->History()->IsSaved());
    const auto before = ReadWav(file);

    int asked = 0;
    QuillexWindow::SetSaveQuestion([&](QuillexWindow*) {
        ++asked;
        return GetParam();
    });
    window->PostMessage(kMsgQuitRequested);
    Drain();
    EXPECT_EQ(asked, 1);
    const auto after = ReadWav(file);
    switch (GetParam()) {
    case QuillexWindow::kDontSave:
        EXPECT_FALSE(IsListed(fixture, window));
        EXPECT_EQ(after, before);
        break;
    case QuillexWindow::kSave:
        EXPECT_FALSE(IsListed(fixture, window));
        ASSERT_EQ(after.size(), 2u);  // written again, as the stereo mix
        EXPECT_EQ(after[0].size(), 200u);
        break;
    case QuillexWindow::kDontQuit:
        EXPECT_TRUE(IsListed(fixture, window));
        EXPECT_TRUE(window->isVisible());
        EXPECT_EQ(after, before);
        break;
    }
}

INSTANTIATE_TEST_SUITE_P(Answers, CloseLoadedDocument,
    testing::Values(int(QuillexWindow::kDontSave), int(QuillexWindow::kSave), int(QuillexWindow::kDontQuit)));

TEST(QuillexWindow, TheAlertShowsItsThreeButtonsLeftToRight)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    QStringList labels;
    QString text;
    QString name;
    QMessageBox::Icon icon = QMessageBox::NoIcon;
    QTimer::singleShot(0, [&] {
        auto* alert = qobject_cast<QMessageBox*>(QApplication::activeModalWidget());
        ASSERT_NE(alert, nullptr);
        text = alert->text();
        name = alert->objectName();
        icon = alert->icon();
        QList<QAbstractButton*> buttons = alert->buttons();
        std::sort(buttons.begin(), buttons.end(), [alert](QAbstractButton* a, QAbstractButton* b) {
            return a->mapTo(alert, QPoint(0, 0)).x() < b->mapTo(alert, QPoint(0, 0)).x();
        });
        for (QAbstractButton* button : buttons)
            labels << button->text();
        buttons.at(1)->click();
    });
    EXPECT_EQ(QuillexWindow::AskSaveChanges(window), QuillexWindow::kSave);
    EXPECT_EQ(text, "Save changes?");
    EXPECT_EQ(name, "alert");
    EXPECT_EQ(icon, QMessageBox::Warning);
    EXPECT_EQ(labels, (QStringList{"Nope!", "Yes, please.", "Don't quit!"}));
}

TEST(QuillexWindow, TheAlertsEscapeKeepsTheWindow)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    QTimer::singleShot(0, [] {
        QWidget* alert = QApplication::activeModalWidget();
        ASSERT_NE(alert, nullptr);
        QTest::keyClick(alert, Qt::Key_Escape);
    });
    EXPECT_EQ(QuillexWindow::AskSaveChanges(window), QuillexWindow::kDontQuit);
}

}  // namespace
}  // namespace glimmet::test
