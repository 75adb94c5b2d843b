#include <gtest/gtest.h>

#include <QAction>
#include <QMenu>
#include <QMenuBar>

#include "AppTestSupport.h"
#include "app/MenuTable.h"
#include "edit/HistoryManager.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "views/ChannelContainerView.h"
#include "sound/ChannelSamples.h"

namespace glimmet::test {
namespace {

struct Expected {
    const char* label;  // null: separator
    QKeySequence shortcut;
};

QKeySequence Ctrl(Qt::Key key)
{
    return QKeySequence(QKeyCombination(Qt::ControlModifier, key));
}

QKeySequence CtrlShift(Qt::Key key)
{
    return QKeySequence(QKeyCombination(Qt::ControlModifier | Qt::ShiftModifier, key));
}

const std::vector<std::pair<QString, std::vector<Expected>>>& ExpectedMenus()
{
    static const std::vector<std::pair<QString, std::vector<Expected>>> menus = {
        {"File",
            {{"New", Ctrl(Qt::Key_N)}, {"Open\u2026", Ctrl(Qt::Key_O)}, {"Append\u2026", CtrlShift(Qt::Key_O)},
                {nullptr, {}}, {"Save", Ctrl(Qt::Key_S)}, {"Save As\u2026", CtrlShift(Qt::Key_S)}, {nullptr, {}},
                {"About", {}}, {nullptr, {}}, {"Close", Ctrl(Qt::Key_W)}, {"Quit", Ctrl(Qt::Key_Q)}}},
        {"Edit",
            {{"Undo", Ctrl(Qt::Key_Z)}, {"Redo", CtrlShift(Qt::Key_Z)}, {"Delete History", {}}, {nullptr, {}},
                {"Select All", Ctrl(Qt::Key_A)}, {"Select None", {}}, {nullptr, {}}, {"Cut", Ctrl(Qt::Key_X)},
                {"Copy", Ctrl(Qt::Key_C)}, {"Paste", Ctrl(Qt::Key_V)}, {nullptr, {}}, {"Remove", {}},
                {"Truncate", {}}}},
        {"Channel", {{"Add", {}}, {"Remove", {}}}},
        {"Tools",
            {{"Fade In", Ctrl(Qt::Key_I)}, {"Fade Out", Ctrl(Qt::Key_O)}, {"Maximize", Ctrl(Qt::Key_M)},
                {"Envelope\u2026", Ctrl(Qt::Key_E)}, {nullptr, {}}, {"Revert", {}}, {"Revert Phases", {}},
                {nullptr, {}}, {"FIR Filter\u2026", {}}, {"Distort\u2026", {}}, {"Peak Distort\u2026", {}}}},
        {"View", {{"Zoom Range", Ctrl(Qt::Key_R)}, {"Show All", Ctrl(Qt::Key_E)}}},
        {"Help", {{"Index", Ctrl(Qt::Key_H)}, {"Send Feedback", {}}, {"Bubble Help", {}}}},
    };
    return menus;
}

QAction* FindItem(QuillexWindow* window, const QString& menu, const QString& label)
{
    for (QAction* top : window->menuBar()->actions()) {
        if (top->text() != menu)
            continue;
        for (QAction* item : top->menu()->actions()) {
            if (item->text() == label)
                return item;
        }
    }
    return nullptr;
}

/// A loaded window with every channel selected over the whole document.
QuillexWindow* EditableWindow(AppFixture& fixture, int channels = 1, int frames = 100)
{
    QuillexWindow* window = fixture.App().NewWindow();
    window->LockWindow();
    window->SetTo(fixture.MakeSound("menu.wav", channels, frames));
    window->UnlockWindow();
    Drain();
    window->PostMessage(kMsgSelectAll);
    Drain();
    return window;
}

TEST(Menus, TheTreeHasEveryLabelAndShortcutInOrder)
{
    AppFixture fixture;
    QuillexWindow* window = fixture.App().NewWindow();
    const QList<QAction*> tops = window->menuBar()->actions();
    const auto& expected = ExpectedMenus();
    ASSERT_EQ(tops.size(), qsizetype(expected.size()));
    for (size_t m = 0; m < expected.size(); ++m) {
        SCOPED_TRACE(expected[m].first.toStdString());
        EXPECT_EQ(tops[qsizetype(m)]->text(), expected[m].first);
        const QList<QAction*> items = tops[qsizetype(m)]->menu()->actions();
        ASSERT_EQ(items.size(), qsizetype(expected[m].second.size()));
        for (size_t i = 0; i < expected[m].second.size(); ++i) {
            const Expected& want = expected[m].second[i];
            QAction* item = items[qsizetype(i)];
            if (want.label == nullptr) {
                EXPECT_TRUE(item->isSeparator()) << i;
                continue;
            }
            EXPECT_EQ(item->text(), QString::fromUtf8(want.label));
            EXPECT_EQ(item->shortcut(), want.shortcut) << want.label;
            EXPECT_TRUE(item->isEnabled()) << want.label;
            EXPECT_FALSE(item->isChecked()) << want.label;
        }
    }
}

TEST(Menus, TheEllipsisIsOneCharacter)
{
    AppFixture fixture;
    QuillexWindow* window = fixture.App().NewWindow();
    const QString open = FindItem(window, "File", "Open\u2026")->text();
    EXPECT_EQ(open.size(), 5);
    EXPECT_EQ(open.back(), QChar(0x2026));
}

TEST(Menus, TheTableSendsTheCodesToTheTargets)
{
    const std::vector<MenuEntry>& table = DocumentMenuTable();
    const auto code = [&](const char* menu, const char* label) -> const MenuEntry* {
        for (const MenuEntry& entry : table) {
            if (entry.label != nullptr && std::string(entry.menu) == menu && std::string(entry.label) == label)
                return &entry;
        }
        return nullptr;
    };
    ASSERT_NE(code("File", "Close"), nullptr);
    EXPECT_EQ(code("File", "Close")->code, kMsgQuitRequested);
    EXPECT_FALSE(code("File", "Close")->toApplication);
    EXPECT_EQ(code("File", "Quit")->code, kMsgQuitRequested);
    EXPECT_TRUE(code("File", "Quit")->toApplication);
    EXPECT_TRUE(code("File", "New")->toApplication);
    EXPECT_TRUE(code("File", "About")->toApplication);
    EXPECT_TRUE(code("Help", "Index")->toApplication);
    EXPECT_EQ(code("Help", "Index")->code, kMsgHelp);
    EXPECT_TRUE(code("Help", "Bubble Help")->toApplication);
    EXPECT_EQ(code("Channel", "Remove")->code, kMsgRemoveChannel);
    EXPECT_EQ(code("Edit", "Remove")->code, kMsgRemove);
    EXPECT_EQ(code("Tools", "Peak Distort\u2026")->code, kMsgCompressor);
    EXPECT_FALSE(code("Tools", "Fade In")->toApplication);
}

TEST(Menus, ItemsForTheApplicationReachIt)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    QuillexWindow* window = fixture.App().WindowAt(0);
    FindItem(window, "File", "New")->trigger();
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 2);
    FindItem(window, "Help", "Bubble Help")->trigger();
    Drain();
    EXPECT_TRUE(fixture.App().IsBubbleHelpEnabled());
    EXPECT_TRUE(window->MenuItem(KeptMenuItem::BubbleHelp)->isChecked());
    FindItem(window, "File", "Quit")->trigger();
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 0);
    EXPECT_EQ(fixture.QuitCount(), 1);
}

TEST(Menus, CloseEndsOnlyItsWindow)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    fixture.App().NewWindow();
    QuillexWindow* window = fixture.App().WindowAt(0);
    FindItem(window, "File", "Close")->trigger();
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 1);
    EXPECT_NE(fixture.App().WindowAt(0), window);
}

TEST(Menus, AfterAFadeInUndoNamesItAndAfterUndoRedoDoes)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture);
    QAction* undo = window->MenuItem(KeptMenuItem::Undo);
    QAction* redo = window->MenuItem(KeptMenuItem::Redo);
    QAction* clear = window->MenuItem(KeptMenuItem::DeleteHistory);
    const int16_t before = test::SamplesOf(*window->Manager()->ChannelAt(0)).at(0);
    FindItem(window, "Tools", "Fade In")->trigger();
    Drain();
    EXPECT_NE(test::SamplesOf(*window->Manager()->ChannelAt(0)).at(0), before);
    EXPECT_EQ(undo->text(), "Undo Fade In");
    EXPECT_TRUE(undo->isEnabled());
    EXPECT_EQ(redo->text(), "Redo");
    EXPECT_FALSE(redo->isEnabled());
    EXPECT_TRUE(clear->isEnabled());

    undo->trigger();
    Drain();
    EXPECT_EQ(test::SamplesOf(*window->Manager()->ChannelAt(0)).at(0), before);
    EXPECT_EQ(undo->text(), "Undo");
    EXPECT_FALSE(undo->isEnabled());
    EXPECT_EQ(redo->text(), "Redo Fade In");
    EXPECT_TRUE(redo->isEnabled());
    EXPECT_TRUE(clear->isEnabled());

    redo->trigger();
    Drain();
    EXPECT_EQ(undo->text(), "Undo Fade In");
    EXPECT_FALSE(redo->isEnabled());
}

TEST(Menus, DeleteHistoryDisablesUndoRedoAndItself)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture);
    FindItem(window, "Tools", "Fade Out")->trigger();
    Drain();
    FindItem(window, "Tools", "Maximize")->trigger();
    Drain();
    window->MenuItem(KeptMenuItem::Undo)->trigger();
    Drain();
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Fade Out");
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Redo)->text(), "Redo Maximize");
    window->MenuItem(KeptMenuItem::DeleteHistory)->trigger();
    Drain();
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo");
    EXPECT_FALSE(window->MenuItem(KeptMenuItem::Undo)->isEnabled());
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Redo)->text(), "Redo");
    EXPECT_FALSE(window->MenuItem(KeptMenuItem::Redo)->isEnabled());
    EXPECT_FALSE(window->MenuItem(KeptMenuItem::DeleteHistory)->isEnabled());
}

TEST(Menus, SaveIsDisabledAfterASaveAndEnabledByTheNextEdit)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture);
    QAction* save = window->MenuItem(KeptMenuItem::Save);
    EXPECT_TRUE(save->isEnabled());
    FindItem(window, "Tools", "Revert")->trigger();
    Drain();
    EXPECT_TRUE(save->isEnabled());
    save->trigger();
    Drain();
    EXPECT_FALSE(save->isEnabled());
    FindItem(window, "Tools", "Revert Phases")->trigger();
    Drain();
    EXPECT_TRUE(save->isEnabled());
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Revert Phases");
}

TEST(Menus, CopyWithTwoSelectedChannelsStoresTwoArraysOfTheRange)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture, 2, 500);
    window->Manager()->SetRangeStart(200);
    window->Manager()->SetRangeEnd(299);
    FindItem(window, "Edit", "Copy")->trigger();
    Drain();
    std::vector<const int16_t*> channels;
    int32_t count = 0;
    int64_t frames = 0;
    ASSERT_TRUE(fixture.App().GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(count, 2);
    EXPECT_EQ(frames, 100);
    for (int32_t c = 0; c < 2; ++c) {
        for (int64_t f = 0; f < 100; ++f)
            ASSERT_EQ(channels[size_t(c)][f], int16_t((c + 1) * 100 + 200 + f)) << c << " " << f;
    }
}

TEST(Menus, CopyWithOnlyTheSecondChannelSelectedCopiesIt)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture, 2, 50);
    window->Manager()->ChannelAt(0)->SetSelected(false);
    window->Copy();
    std::vector<const int16_t*> channels;
    int32_t count = 0;
    int64_t frames = 0;
    ASSERT_TRUE(fixture.App().GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(count, 1);
    EXPECT_EQ(frames, 50);
    EXPECT_EQ(channels[0][0], 200);
}

TEST(Menus, CopyWithNoSelectedChannelLeavesTheBufferAlone)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture, 1, 40);
    window->Copy();
    std::vector<const int16_t*> before;
    int32_t count = 0;
    int64_t frames = 0;
    ASSERT_TRUE(fixture.App().GetCopyBuffer(before, count, frames));
    window->PostMessage(kMsgSelectNone);
    Drain();
    window->Manager()->SetRangeStart(0);
    window->Manager()->SetRangeEnd(9);
    window->Copy();
    std::vector<const int16_t*> after;
    ASSERT_TRUE(fixture.App().GetCopyBuffer(after, count, frames));
    EXPECT_EQ(after, before);
    EXPECT_EQ(frames, 40);
}

TEST(Menus, ShowAllAndZoomRangeChangeTheDisplay)
{
    AppFixture fixture;
    QuillexWindow* window = EditableWindow(fixture, 1, 20000);
    window->Manager()->SetRangeStart(5000);
    window->Manager()->SetRangeEnd(9999);
    window->MessageReceived(Message(kMsgZoomRange));
    EXPECT_GE(window->ContainerView()->FirstDisplayedFrame(), 4000);
    window->MessageReceived(Message(kMsgShowAll));
    Drain();
    EXPECT_EQ(window->ContainerView()->FirstDisplayedFrame(), 0);
    EXPECT_EQ(window->ContainerView()->LastDisplayedFrame(), 19999);
}

}  // namespace
}  // namespace glimmet::test
