#include <gtest/gtest.h>

#include "support/Message.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

TEST(MessageTest, FindsFieldsOfTheirOwnType)
{
    Message message(kMsgRangeStartChanged);
    message.AddInt64("range start", 1234);
    message.AddInt32("mode", 2);
    message.AddBool("flag", true);
    message.AddFloat("rate", 44100.0f);
    message.AddString("name", "sound.wav");
    int probe = 0;
    message.AddPointer("window", &probe);

    int64_t frame = 0;
    EXPECT_EQ(message.FindInt64("range start", &frame), B_OK);
    EXPECT_EQ(frame, 1234);
    int32_t mode = 0;
    EXPECT_EQ(message.FindInt32("mode", &mode), B_OK);
    EXPECT_EQ(mode, 2);
    bool flag = false;
    EXPECT_EQ(message.FindBool("flag", &flag), B_OK);
    EXPECT_TRUE(flag);
    float rate = 0;
    EXPECT_EQ(message.FindFloat("rate", &rate), B_OK);
    EXPECT_EQ(rate, 44100.0f);
    std::string name;
    EXPECT_EQ(message.FindString("name", &name), B_OK);
    EXPECT_EQ(name, "sound.wav");
    int* pointer = nullptr;
    EXPECT_EQ(message.FindPointer("window", &pointer), B_OK);
    EXPECT_EQ(pointer, &probe);
}

TEST(MessageTest, MissingNameAndWrongTypeFail)
{
    Message message(kMsgUpdatePlaymark);
    message.AddInt32("current frame", 7);
    int64_t frame = -5;
    EXPECT_EQ(message.FindInt64("current frame", &frame), B_BAD_TYPE);
    EXPECT_EQ(frame, -5);
    EXPECT_EQ(message.FindInt64("no such field", &frame), B_NAME_NOT_FOUND);
    EXPECT_EQ(frame, -5);
    EXPECT_EQ(message.AddInt64("current frame", 8), B_BAD_TYPE);
    EXPECT_EQ(message.CountValues("current frame"), 1);
}

TEST(MessageTest, RepeatedValuesKeepTheirOrder)
{
    Message message(kMsgSimpleData);
    message.AddPath("refs", "/tmp/a.wav");
    message.AddPath("refs", "/tmp/b.wav");
    std::filesystem::path path;
    EXPECT_EQ(message.FindPath("refs", &path, 1), B_OK);
    EXPECT_EQ(path, "/tmp/b.wav");
    EXPECT_EQ(message.FindPath("refs", &path, 2), B_BAD_INDEX);
    EXPECT_EQ(message.CountValues("refs"), 2);
}

TEST(MessageCodesTest, CodesAreTheirFourCharactersBigEndian)
{
    EXPECT_EQ(kMsgPlay, 0x706c6179u);
    EXPECT_EQ(kMsgCut, 0x43435554u);
    EXPECT_EQ(FourCharText(kMsgRangeEndChanged), "rech");
    EXPECT_EQ(FourCharText(kMsgQuitRequested), "_QRQ");
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

TEST(MessageInfoTest, FieldsByIndexInTheOrderTheyWereAdded)
{
    Message message(kMsgSimpleData);
    message.AddString("name", "a");
    message.AddInt64("frame", 5);
    message.AddString("name", "b");
    message.AddPath("file", "/tmp/x.wav");

    std::string name;
    Message::FieldType type{};
    int32_t count = 0;
    ASSERT_EQ(message.GetInfo(0, &name, &type, &count), B_OK);
    EXPECT_EQ(name, "name");
    EXPECT_EQ(type, Message::FieldType::kString);
    EXPECT_EQ(count, 2);
    ASSERT_EQ(message.GetInfo(1, &name, &type, &count), B_OK);
    EXPECT_EQ(name, "frame");
    EXPECT_EQ(type, Message::FieldType::kInt64);
    EXPECT_EQ(count, 1);
    ASSERT_EQ(message.GetInfo(2, &name, &type, nullptr), B_OK);
    EXPECT_EQ(name, "file");
    EXPECT_EQ(type, Message::FieldType::kPath);
    EXPECT_EQ(message.GetInfo(3, &name, &type, &count), B_BAD_INDEX);
    EXPECT_EQ(message.GetInfo(-1, nullptr, nullptr, nullptr), B_BAD_INDEX);
    EXPECT_EQ(name, "file");
}

TEST(MessageInfoTest, EveryKindReportsItsType)
{
    Message message;
    message.AddInt32("i32", 1);
    message.AddInt64("i64", 1);
    message.AddBool("bool", true);
    message.AddFloat("float", 1.0f);
    message.AddPointer("pointer", &message);
    message.AddString("string", "s");
    message.AddPath("path", "/");
    const Message::FieldType expected[] = {
        Message::FieldType::kInt32,   Message::FieldType::kInt64,  Message::FieldType::kBool,
        Message::FieldType::kFloat,   Message::FieldType::kPointer, Message::FieldType::kString,
        Message::FieldType::kPath,
    };
    for (int32_t i = 0; i < 7; i++) {
        Message::FieldType type{};
        ASSERT_EQ(message.GetInfo(i, nullptr, &type, nullptr), B_OK);
        EXPECT_EQ(type, expected[i]) << i;
    }
}

TEST(MessageInfoTest, InfoByName)
{
    Message message;
    message.AddBool("flag", true);
    message.AddBool("flag", false);
    Message::FieldType type{};
    int32_t count = 0;
    EXPECT_EQ(message.GetInfo("flag", &type, &count), B_OK);
    EXPECT_EQ(type, Message::FieldType::kBool);
    EXPECT_EQ(count, 2);
    EXPECT_EQ(message.GetInfo("missing", &type, &count), B_NAME_NOT_FOUND);
    EXPECT_EQ(count, 2);
}

TEST(MessageInfoTest, CopyValueAppendsOneValueOfAnyType)
{
    Message from;
    from.AddFloat("gain", 0.25f);
    from.AddFloat("gain", 0.75f);
    Message to;
    to.AddFloat("gain", 1.0f);
    EXPECT_EQ(to.CopyValue(from, "gain", 1), B_OK);
    float gain = 0;
    ASSERT_EQ(to.FindFloat("gain", &gain, 1), B_OK);
    EXPECT_EQ(gain, 0.75f);
    EXPECT_EQ(to.CopyValue(from, "gain", 2), B_BAD_INDEX);
    EXPECT_EQ(to.CopyValue(from, "loss", 0), B_NAME_NOT_FOUND);
    to.AddInt32("count", 1);
    from.AddString("count", "one");
    EXPECT_EQ(to.CopyValue(from, "count", 0), B_BAD_TYPE);
    EXPECT_EQ(to.CountValues("gain"), 2);
    EXPECT_EQ(to.CountValues("count"), 1);
}

TEST(MessageInfoTest, CopyValueFromItself)
{
    Message message;
    message.AddString("word", "again");
    EXPECT_EQ(message.CopyValue(message, "word", 0), B_OK);
    std::string word;
    ASSERT_EQ(message.FindString("word", &word, 1), B_OK);
    EXPECT_EQ(word, "again");
}

}  // namespace
}  // namespace glimmet
