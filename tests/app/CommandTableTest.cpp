#include "app/CommandTable.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/MessageCodes.h"

namespace glimmet {
namespace {

TEST(CommandTable, DispatchesToTheRowOfTheCode)
{
    CommandTable table;
    std::vector<std::string> calls;
    table.Add(kMsgUndo, [&] { calls.push_back("undo"); });
    table.Add(kMsgRedo, [&] { calls.push_back("redo"); });
    EXPECT_TRUE(table.Dispatch(Message(kMsgRedo)));
    EXPECT_TRUE(table.Dispatch(Message(kMsgUndo)));
    EXPECT_EQ(calls, (std::vector<std::string>{"redo", "undo"}));
}

TEST(CommandTable, AnUnknownCodeIsLeftAlone)
{
    CommandTable table;
    int calls = 0;
    table.Add(kMsgUndo, [&] { calls++; });
    EXPECT_FALSE(table.Dispatch(Message(kMsgRedo)));
    EXPECT_FALSE(table.Handles(kMsgRedo));
    EXPECT_TRUE(table.Handles(kMsgUndo));
    EXPECT_EQ(calls, 0);
}

TEST(CommandTable, TheHandlerGetsTheMessageWithItsFields)
{
    CommandTable table;
    int64_t seen = 0;
    table.Add(kMsgRangeStartChanged, [&](const Message& message) { message.FindInt64("range start", &seen); });
    Message message(kMsgRangeStartChanged);
    message.AddInt64("range start", 4711);
    ASSERT_TRUE(table.Dispatch(message));
    EXPECT_EQ(seen, 4711);
}

TEST(CommandTable, ALaterRowReplacesAnEarlierOne)
{
    CommandTable table;
    int first = 0;
    int second = 0;
    table.Add(kMsgCopy, [&] { first++; });
    table.Add(kMsgCopy, [&] { second++; });
    table.Dispatch(Message(kMsgCopy));
    EXPECT_EQ(first, 0);
    EXPECT_EQ(second, 1);
}

TEST(CommandTable, AHandlerMayReplaceItsOwnRowWhileItRuns)
{
    CommandTable table;
    int replaced = 0;
    table.Add(kMsgPaste, [&] {
        table.Add(kMsgPaste, [&] { replaced++; });
    });
    ASSERT_TRUE(table.Dispatch(Message(kMsgPaste)));
    EXPECT_EQ(replaced, 0);
    table.Dispatch(Message(kMsgPaste));
    EXPECT_EQ(replaced, 1);
}

}  // namespace
}  // namespace glimmet
