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
