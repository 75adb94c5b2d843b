#include <gtest/gtest.h>

#include <string>

#include "sound/Observable.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

TEST(AddDataToMessageTest, CopiesEveryFieldAndEndsWithBadIndex)
{
    Message from(kMsgSimpleData);
    from.AddInt32("a", 1);
    from.AddFloat("b", 0.5f);
    from.AddInt32("a", 2);
    Message to(kMsgStop);
    EXPECT_EQ(add_data_to_message(&to, &from), B_BAD_INDEX);
    EXPECT_EQ(to.what, kMsgStop);
    EXPECT_EQ(to.CountValues("a"), 2);
    int32_t a = 0;
    EXPECT_EQ(to.FindInt32("a", &a, 1), B_OK);
    EXPECT_EQ(a, 2);
    float b = 0;
    EXPECT_EQ(to.FindFloat("b", &b), B_OK);
    EXPECT_EQ(b, 0.5f);
}

TEST(AddDataToMessageTest, EmptySourceEndsAtOnce)
{
    Message from;
    Message to;
    to.AddBool("kept", true);
    EXPECT_EQ(add_data_to_message(&to, &from), B_BAD_INDEX);
    EXPECT_EQ(to.CountValues("kept"), 1);
}

TEST(AddDataToMessageTest, SameNameOfAnotherTypeIsNotMerged)
{
    // Held under the name but not the type: the copy is tried and refused,
    // since one name holds one type.
    Message from;
    from.AddString("value", "text");
    Message to;
    to.AddInt32("value", 3);
    EXPECT_EQ(add_data_to_message(&to, &from), B_BAD_INDEX);
    Message::FieldType type{};
    int32_t count = 0;
    ASSERT_EQ(to.GetInfo("value", &type, &count), B_OK);
    EXPECT_EQ(type, Message::FieldType::kInt32);
    EXPECT_EQ(count, 1);
}

// Copied fields are never held to one value size: a field whose values
// differ in size arrives whole, and the copy keeps taking values of any
// size afterwards. A Message has no fixed-size fields at all, so this is
// everything of that rule that can be seen here.
TEST(AddDataToMessageTest, CopiedFieldsTakeValuesOfAnySize)
{
    Message from;
    from.AddString("word", "a");
    from.AddString("word", "three");
    from.AddString("word", "");
    Message to;
    add_data_to_message(&to, &from);
    ASSERT_EQ(to.CountValues("word"), 3);
    std::string word;
    EXPECT_EQ(to.FindString("word", &word, 0), B_OK);
    EXPECT_EQ(word, "a");
    EXPECT_EQ(to.FindString("word", &word, 1), B_OK);
    EXPECT_EQ(word, "three");
    EXPECT_EQ(to.FindString("word", &word, 2), B_OK);
    EXPECT_EQ(word, "");
    EXPECT_EQ(to.AddString("word", "a good deal longer than any before"), B_OK);
    EXPECT_EQ(to.CountValues("word"), 4);
}

}  // namespace
}  // namespace glimmet
