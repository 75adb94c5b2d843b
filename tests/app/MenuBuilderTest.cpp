#include "app/MenuBuilder.h"

#include <gtest/gtest.h>

#include <QAction>
#include <QMenu>
#include <QMenuBar>
#include <QMainWindow>
#include <QTest>

#include <vector>

#include "support/MessageCodes.h"

namespace glimmet {
namespace {

class MenuBuilderTest : public ::testing::Test {
protected:
    MenuBuilderTest() { bar = menus.Build(&parent); }

    QAction* Find(const QString& menu, const QString& label)
    {
        for (QAction* title : bar->actions()) {
            if (title->text() != menu || title->menu() == nullptr)
                continue;
            for (QAction* item : title->menu()->actions()) {
                if (item->text() == label)
                    return item;
            }
        }
        return nullptr;
    }

    std::vector<uint32_t> toWindow;
    std::vector<uint32_t> toApplication;
    QMainWindow parent;
    MenuBuilder menus{[this](const Message& message) { toWindow.push_back(message.what); },
        [this](const Message& message) { toApplication.push_back(message.what); }};
    QMenuBar* bar = nullptr;
};

TEST_F(MenuBuilderTest, EachItemPostsWhereItsRowSays)
{
    ASSERT_NE(Find("Edit", "Paste"), nullptr);
    ASSERT_NE(Find("File", "New"), nullptr);
    Find("Edit", "Paste")->trigger();
    Find("File", "New")->trigger();
    EXPECT_EQ(toWindow, std::vector<uint32_t>{kMsgPaste});
    EXPECT_EQ(toApplication, std::vector<uint32_t>{kMsgNewWindow});
}

TEST_F(MenuBuilderTest, ShortcutsTakeCtrlAndShiftFromTheRow)
{
    EXPECT_EQ(Find("File", "Save")->shortcut(), QKeySequence(Qt::CTRL | Qt::Key_S));
    EXPECT_EQ(Find("File", "Save As\u2026")->shortcut(), QKeySequence(Qt::CTRL | Qt::SHIFT | Qt::Key_S));
    EXPECT_TRUE(Find("Edit", "Select None")->shortcut().isEmpty());
}

TEST_F(MenuBuilderTest, KeptItemsAreTheOnesInTheMenus)
{
    EXPECT_EQ(menus.Item(KeptMenuItem::Save), Find("File", "Save"));
    EXPECT_EQ(menus.Item(KeptMenuItem::Undo), Find("Edit", "Undo"));
    EXPECT_EQ(menus.Item(KeptMenuItem::Redo), Find("Edit", "Redo"));
    EXPECT_EQ(menus.Item(KeptMenuItem::DeleteHistory), Find("Edit", "Delete History"));
    EXPECT_EQ(menus.Item(KeptMenuItem::ZoomRange), Find("View", "Zoom Range"));
    EXPECT_EQ(menus.Item(KeptMenuItem::BubbleHelp), Find("Help", "Bubble Help"));
    EXPECT_EQ(menus.Item(KeptMenuItem::None), nullptr);
}

TEST_F(MenuBuilderTest, AClickAloneDoesNotMarkBubbleHelp)
{
    QAction* bubbleHelp = menus.Item(KeptMenuItem::BubbleHelp);
    ASSERT_TRUE(bubbleHelp->isCheckable());
    bubbleHelp->trigger();
    EXPECT_FALSE(bubbleHelp->isChecked());
    EXPECT_EQ(toApplication, std::vector<uint32_t>{kMsgToggleBubbleHelp});
}

TEST_F(MenuBuilderTest, ASharedShortcutFiresTheFirstItemInMenuBarOrder)
{
    parent.setMenuBar(bar);
    parent.show();
    ASSERT_TRUE(QTest::qWaitForWindowActive(&parent));
    QTest::keyClick(&parent, Qt::Key_O, Qt::ControlModifier);
    QTest::keyClick(&parent, Qt::Key_E, Qt::ControlModifier);
    EXPECT_EQ(toWindow, (std::vector<uint32_t>{kMsgOpen, kMsgEnvelope}));
}

TEST_F(MenuBuilderTest, BothItemsOfASharedShortcutShowIt)
{
    EXPECT_EQ(Find("Tools", "Fade Out")->shortcut(), QKeySequence(Qt::CTRL | Qt::Key_O));
    EXPECT_EQ(Find("View", "Show All")->shortcut(), QKeySequence(Qt::CTRL | Qt::Key_E));
    EXPECT_EQ(Find("File", "Open\u2026")->shortcutContext(), Qt::WindowShortcut);
    EXPECT_EQ(Find("Tools", "Envelope\u2026")->shortcutContext(), Qt::WindowShortcut);
    EXPECT_EQ(Find("Tools", "Fade Out")->shortcutContext(), Qt::WidgetShortcut);
    EXPECT_EQ(Find("View", "Show All")->shortcutContext(), Qt::WidgetShortcut);
}

TEST_F(MenuBuilderTest, TheSecondItemOfAPairStillWorksFromItsMenu)
{
    Find("Tools", "Fade Out")->trigger();
    Find("View", "Show All")->trigger();
    EXPECT_EQ(toWindow, (std::vector<uint32_t>{kMsgFadeOut, kMsgShowAll}));
}

}  // namespace
}  // namespace glimmet
