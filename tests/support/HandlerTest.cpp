#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QThread>
#include <thread>
#include <vector>

#include "support/Handler.h"
#include "support/MessageCodes.h"
#include "support/Status.h"

namespace glimmet {
namespace {

class RecordingHandler : public Handler {
public:
    void MessageReceived(const Message& message) override
    {
        threads.push_back(QThread::currentThread());
        int32_t index = -1;
        message.FindInt32("index", &index);
        indexes.push_back(index);
        codes.push_back(message.what);
    }

    std::vector<QThread*> threads;
    std::vector<int32_t> indexes;
    std::vector<uint32_t> codes;
};

TEST(HandlerTest, PostsFromAnotherThreadArriveInOrderInTheHandlersThread)
{
    RecordingHandler handler;
    std::thread poster([&] {
        for (int32_t i = 0; i < 500; ++i) {
            Message message(kMsgUpdatePlaymark);
            message.AddInt32("index", i);
            EXPECT_EQ(handler.PostMessage(message), B_OK);
        }
    });
    poster.join();
    EXPECT_TRUE(handler.indexes.empty());
    QCoreApplication::processEvents();
    ASSERT_EQ(handler.indexes.size(), 500u);
    for (int32_t i = 0; i < 500; ++i)
        EXPECT_EQ(handler.indexes[size_t(i)], i);
    for (QThread* thread : handler.threads)
        EXPECT_EQ(thread, QThread::currentThread());
}

TEST(HandlerTest, BareCommands)
{
    RecordingHandler handler;
    handler.PostMessage(kMsgStop);
    handler.PostMessage(kMsgPlay);
    QCoreApplication::processEvents();
    EXPECT_EQ(handler.codes, std::vector<uint32_t>({kMsgStop, kMsgPlay}));
}

TEST(StatusTest, EveryCodeHasAText)
{
    EXPECT_STREQ(StatusText(B_OK), "No error");
    EXPECT_STREQ(StatusText(B_ERROR), "General system error");
    EXPECT_STREQ(StatusText(B_NO_MEMORY), "Out of memory");
    EXPECT_STREQ(StatusText(B_BAD_VALUE), "Bad value");
    EXPECT_STREQ(StatusText(B_NO_INIT), "Initialization failed");
    EXPECT_STREQ(StatusText(12345), "Unknown error");
    EXPECT_EQ(B_NO_MEMORY, int32_t(0x80000000u));
    EXPECT_EQ(B_BAD_VALUE, int32_t(0x80000005u));
    EXPECT_EQ(B_NO_INIT, int32_t(0x8000000du));
}

}  // namespace
}  // namespace glimmet
