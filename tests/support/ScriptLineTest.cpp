#include <gtest/gtest.h>

#include <climits>
#include <string>

#include "support/ScriptLine.h"

namespace glimmet {
namespace {

using Words = ScriptLine::Words;

TEST(ScriptLineTest, WordsAndQuotedWords)
{
    std::string name;
    Words arguments;
    ASSERT_TRUE(ScriptLine::Parse("  field \"Stretch factor:\" 2.0", &name, &arguments));
    EXPECT_EQ(name, "field");
    EXPECT_EQ(arguments, (Words{"Stretch factor:", "2.0"}));
    ASSERT_TRUE(ScriptLine::Parse("say \"unclosed words", &name, &arguments));
    EXPECT_EQ(arguments, (Words{"unclosed words"}));
    ASSERT_TRUE(ScriptLine::Parse("\"\" x", &name, &arguments));
    EXPECT_EQ(name, "");
    EXPECT_EQ(arguments, (Words{"x"}));
}

TEST(ScriptLineTest, BlankLinesAndCommentsAreSkipped)
{
    std::string name = "kept";
    Words arguments;
    EXPECT_FALSE(ScriptLine::Parse("", &name, &arguments));
    EXPECT_FALSE(ScriptLine::Parse(" \t\r", &name, &arguments));
    EXPECT_FALSE(ScriptLine::Parse("   # open x.wav", &name, &arguments));
    EXPECT_EQ(name, "kept");
}

// Every blank that separates words also makes a line blank: a line of a
// newline, a vertical tab or a form feed once passed as a command with no
// words at all.
TEST(ScriptLineTest, EveryBlankIsABlankForSkippingToo)
{
    std::string name;
    Words arguments;
    for (const char* line : {"\n", "\v", "\f", " \n\v\f\t\r "})
        EXPECT_FALSE(ScriptLine::Parse(line, &name, &arguments)) << int(line[0]);
    ASSERT_TRUE(ScriptLine::Parse("\vundo\f", &name, &arguments));
    EXPECT_EQ(name, "undo");
    EXPECT_TRUE(arguments.empty());
}

TEST(ScriptLineTest, IntegersAreWholeDecimalTexts)
{
    int64_t value = 0;
    EXPECT_TRUE(ScriptLine::ParseInteger("-9223372036854775808", &value));
    EXPECT_EQ(value, INT64_MIN);
    EXPECT_FALSE(ScriptLine::ParseInteger("9223372036854775808", &value)) << "one past the largest";
    EXPECT_FALSE(ScriptLine::ParseInteger("12abc", &value));
    EXPECT_FALSE(ScriptLine::ParseInteger("", &value));
    EXPECT_FALSE(ScriptLine::ParseInteger(" 1", &value));
    EXPECT_FALSE(ScriptLine::ParseInteger("+1", &value));
}

TEST(ScriptLineTest, RangeFieldsReadLikeStrtolKeptTo32Bits)
{
    EXPECT_EQ(ScriptLine::RangeFieldNumber("  42 frames"), 42);
    EXPECT_EQ(ScriptLine::RangeFieldNumber("-1"), -1);
    EXPECT_EQ(ScriptLine::RangeFieldNumber("abc"), 0);
    EXPECT_EQ(ScriptLine::RangeFieldNumber(""), 0);
    EXPECT_EQ(ScriptLine::RangeFieldNumber("2147483647"), 2147483647);
    EXPECT_EQ(ScriptLine::RangeFieldNumber("2147483648"), -2147483648LL);
    EXPECT_EQ(ScriptLine::RangeFieldNumber("4294967297"), 1);
    // strtol stops at the long's largest value, whose low 32 bits are all
    // ones.
    EXPECT_EQ(ScriptLine::RangeFieldNumber("99999999999999999999999"), -1);
    EXPECT_EQ(ScriptLine::RangeFieldNumber("-99999999999999999999999"), 0);
}

}  // namespace
}  // namespace glimmet
