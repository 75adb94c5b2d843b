#include "app/SaveFlow.h"

#include <gtest/gtest.h>

#include <QAction>
#include <QFileDialog>
#include <QTemporaryDir>
#include <QWidget>

#include <cerrno>
#include <fstream>
#include <iterator>
#include <memory>
#include <vector>

#include "PostedMessages.h"
#include "edit/Action.h"
#include "edit/HistoryManager.h"
#include "files/WriteFaults.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageTarget.h"

namespace glimmet {
namespace {

using test::PostedMessages;

/// An edit that is always ready and changes nothing.
class MarkAction : public Action {
public:
    MarkAction() : Action(nullptr) {}
    status_t InitCheck() override { return B_OK; }
};

class SaveFlowTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(folder.isValid());
        SaveFlow::SetSaveQuestion([this](QuillexWindow*) {
            questions++;
            return answer;
        });
    }
    void TearDown() override { SaveFlow::SetSaveQuestion(nullptr); }

    void MakeUnsaved()
    {
        std::unique_ptr<Action> mark = std::make_unique<MarkAction>();
        ASSERT_EQ(history.AddAction(mark), B_OK);
    }

    std::filesystem::path Folder() const { return folder.path().toStdString(); }

    QTemporaryDir folder;
    QWidget window;
    PostedMessages target;
    ChannelManager manager{nullptr};
    HistoryManager history;
    QAction saveItem;
    SaveFlow flow{window, target, manager, history, saveItem};
    int questions = 0;
    int answer = SaveFlow::kDontQuit;
};

TEST_F(SaveFlowTest, APanelChoiceBecomesTheEntryAndTheTitleAndSaves)
{
    Message choice(kMsgSavePanelChoice);
    choice.AddPath("directory", Folder());
    choice.AddString("name", "take.wav");
    flow.HandlePanelChoice(choice);
    EXPECT_EQ(flow.FileEntry(), Folder() / "take.wav");
    EXPECT_EQ(window.windowTitle(), "Glimmet - take.wav");
    EXPECT_EQ(target.codes, std::vector<uint32_t>{kMsgSave});
}

TEST_F(SaveFlowTest, APanelChoiceIntoNoFolderIsIgnored)
{
    Message choice(kMsgSavePanelChoice);
    choice.AddPath("directory", Folder() / "missing");
    choice.AddString("name", "take.wav");
    flow.HandlePanelChoice(choice);
    EXPECT_FALSE(flow.FileEntry().has_value());
    EXPECT_TRUE(target.codes.empty());
}

TEST_F(SaveFlowTest, SaveWithoutAnEntryShowsThePanel)
{
    EXPECT_EQ(flow.SavePanel(), nullptr);
    flow.Save();
    ASSERT_NE(flow.SavePanel(), nullptr);
    EXPECT_TRUE(flow.SavePanel()->isVisible());
    EXPECT_TRUE(target.codes.empty());
}

TEST_F(SaveFlowTest, AnUntitledEditedDocumentClosesWithoutAQuestion)
{
    MakeUnsaved();
    EXPECT_TRUE(flow.AgreeToClose(nullptr));
    EXPECT_EQ(questions, 0);
}

TEST_F(SaveFlowTest, UnsavedChangesAskAndTheAnswerDecides)
{
    flow.SetFileEntry(Folder() / "kept.wav");
    MakeUnsaved();
    answer = SaveFlow::kDontQuit;
    EXPECT_FALSE(flow.AgreeToClose(nullptr));
    answer = SaveFlow::kDontSave;
    EXPECT_TRUE(flow.AgreeToClose(nullptr));
    EXPECT_FALSE(std::filesystem::exists(Folder() / "kept.wav"));
    answer = SaveFlow::kSave;
    EXPECT_TRUE(flow.AgreeToClose(nullptr));
    EXPECT_EQ(questions, 3);
    EXPECT_TRUE(std::filesystem::exists(Folder() / "kept.wav"));
    EXPECT_TRUE(history.IsSaved());
    EXPECT_FALSE(saveItem.isEnabled());
}

TEST_F(SaveFlowTest, AYesWhoseSaveFailsKeepsTheWindowAndTheEdits)
{
    flow.SetFileEntry(Folder() / "kept.wav");
    { std::ofstream(Folder() / "kept.wav") << "the previous recording"; }
    MakeUnsaved();
    answer = SaveFlow::kSave;
    DiagnosticsCapture capture;
    bool closes = true;
    {
        ScopedWriteFault fault(WriteFaults::Step::Create, EROFS);
        closes = flow.AgreeToClose(nullptr);
    }
    EXPECT_FALSE(closes);
    EXPECT_EQ(capture.Finish(), "error writing file. (Read-only file system)\n");
    EXPECT_FALSE(history.IsSaved());
    EXPECT_TRUE(saveItem.isEnabled());
    std::ifstream in(Folder() / "kept.wav");
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(in), {}), "the previous recording");

    // Asked again once the disk is back, the same answer saves and closes.
    EXPECT_TRUE(flow.AgreeToClose(nullptr));
    EXPECT_EQ(questions, 2);
    EXPECT_TRUE(history.IsSaved());
}

TEST_F(SaveFlowTest, AFailedSaveNamesItsCauseAndLeavesSaveEnabled)
{
    flow.SetFileEntry(Folder() / "kept.wav");
    MakeUnsaved();
    saveItem.setEnabled(false);
    DiagnosticsCapture capture;
    {
        ScopedWriteFault fault(WriteFaults::Step::Sync, EIO);
        flow.Save();
    }
    EXPECT_EQ(capture.Finish(), "error writing file. (Input/output error)\n");
    EXPECT_FALSE(history.IsSaved());
    EXPECT_TRUE(saveItem.isEnabled());
    EXPECT_FALSE(std::filesystem::exists(Folder() / "kept.wav"));
    // Closing now asks, as the edits are in no file.
    answer = SaveFlow::kDontQuit;
    EXPECT_FALSE(flow.AgreeToClose(nullptr));
    EXPECT_EQ(questions, 1);
}

}  // namespace
}  // namespace glimmet
