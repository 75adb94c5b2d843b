#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QThread>
#include <memory>
#include <string>
#include <vector>

#include "ObservableTestSupport.h"
#include "sound/Observable.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

using test::Call;
using test::kTemplateCode;
using test::LoggingObserver;
using test::MaskOf;
using test::Names;
using test::RecordingHandler;
using test::RecordingTarget;

TEST(ObservableTest, OverlappingMaskIsDeliveredAndOthersAreSkipped)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver wide("wide", &log);
    LoggingObserver other("other", &log);
    RecordingTarget wideTarget;
    RecordingTarget otherTarget;
    observable.Subscribe(&wide, 0x6);
    observable.Subscribe(&other, 0x1);
    observable.Subscribe(&wideTarget, 0x6);
    observable.Subscribe(&otherTarget, 0x1);

    observable.Notify(0x4);

    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].who, "wide");
    EXPECT_EQ(log[0].mask, 0x4u);
    EXPECT_EQ(log[0].source, &observable);
    EXPECT_EQ(log[0].data, nullptr);
    ASSERT_EQ(wideTarget.received.size(), 1u);
    EXPECT_EQ(MaskOf(wideTarget.received[0]), 0x4);
    EXPECT_TRUE(otherTarget.received.empty());
}

TEST(ObservableTest, ObserverIsToldOnlyTheOverlap)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver observer("o", &log);
    observable.Subscribe(&observer, 0xF0);
    observable.Notify(0x3C);  // 0011 1100 & 1111 0000 = 0011 0000
    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].mask, 0x30u);
}

TEST(ObservableTest, NoOverlapNoCall)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver zero("zero", &log);
    LoggingObserver some("some", &log);
    observable.Subscribe(&zero, 0);
    observable.Subscribe(&some, 0xFFFFFFFF);
    observable.Notify(0);
    EXPECT_TRUE(log.empty());
    observable.Notify(0x80000000);
    EXPECT_EQ(Names(log), std::vector<std::string>({"some"}));
    EXPECT_EQ(log[0].mask, 0x80000000u);
}

TEST(ObservableTest, ObserverGetsTheNotifiersDataAsItIs)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver observer("o", &log);
    observable.Subscribe(&observer, 1);
    Message data(kMsgSimpleData);
    observable.Notify(1, &data);
    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].data, &data);
}

TEST(ObservableTest, NotificationsFollowTheSubscriptionOrder)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver a("a", &log);
    LoggingObserver b("b", &log);
    LoggingObserver c("c", &log);
    observable.Subscribe(&c, 1);
    observable.Subscribe(&a, 1);
    observable.Subscribe(&b, 1);
    observable.Subscribe(&a, 1);
    observable.Notify(1);
    EXPECT_EQ(Names(log), std::vector<std::string>({"c", "a", "b", "a"}));
}

TEST(ObservableTest, NullSubscribersAreRefused)
{
    Observable observable;
    EXPECT_EQ(observable.Subscribe(static_cast<Observer*>(nullptr), 1), nullptr);
    EXPECT_EQ(observable.Subscribe(static_cast<Handler*>(nullptr), 1), nullptr);
    Message templateMessage(kTemplateCode);
    EXPECT_EQ(observable.Subscribe(static_cast<Handler*>(nullptr), 1, &templateMessage), nullptr);
    EXPECT_EQ(observable.CountSubscriptions(), 0);
}

TEST(ObservableTest, NullTargetIsKeptButGetsNothing)
{
    // Like an address that leads nowhere: accepted, and sending fails quietly.
    Observable observable;
    ObserverHandle* handle = observable.Subscribe(static_cast<MessageTarget*>(nullptr), 1);
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(observable.CountSubscriptions(), 1);
    observable.Notify(1);
    observable.Unsubscribe(handle);
    EXPECT_EQ(observable.CountSubscriptions(), 0);
}

TEST(ObservableTest, TargetIsSentObupWithMaskAndObservable)
{
    Observable observable;
    RecordingTarget target;
    ObserverHandle* handle = observable.Subscribe(&target, 0x3);
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(handle->TargetOf(), &target);
    EXPECT_EQ(handle->Mask(), 0x3u);

    observable.Notify(0x2);

    ASSERT_EQ(target.received.size(), 1u);
    const Message& message = target.received[0];
    EXPECT_EQ(message.what, kMsgObserverUpdate);
    EXPECT_EQ(message.what, FourCharCode("obup"));
    EXPECT_EQ(MaskOf(message), 0x2);
    Observable* source = nullptr;
    ASSERT_EQ(message.FindPointer("observable", &source), B_OK);
    EXPECT_EQ(source, &observable);
}

TEST(ObservableTest, FullMaskArrivesAsTheSameBitsInInt32)
{
    Observable observable;
    RecordingTarget target;
    observable.Subscribe(&target, 0xFFFFFFFF);
    observable.Notify(0x80000001);
    ASSERT_EQ(target.received.size(), 1u);
    EXPECT_EQ(uint32_t(MaskOf(target.received[0])), 0x80000001u);
}

TEST(ObservableTest, DataFieldsAreCopiedBeforeMaskAndObservable)
{
    Observable observable;
    RecordingTarget target;
    observable.Subscribe(&target, 1);
    Message data(kMsgSimpleData);
    data.AddInt64("frame", 44100);
    data.AddString("name", "left");
    data.AddString("name", "right");

    observable.Notify(1, &data);

    ASSERT_EQ(target.received.size(), 1u);
    const Message& message = target.received[0];
    EXPECT_EQ(message.what, kMsgObserverUpdate);  // the data's code is not taken
    int64_t frame = 0;
    EXPECT_EQ(message.FindInt64("frame", &frame), B_OK);
    EXPECT_EQ(frame, 44100);
    std::string name;
    EXPECT_EQ(message.FindString("name", &name, 1), B_OK);
    EXPECT_EQ(name, "right");
    std::string field;
    ASSERT_EQ(message.GetInfo(0, &field, nullptr, nullptr), B_OK);
    EXPECT_EQ(field, "frame");
    ASSERT_EQ(message.GetInfo(2, &field, nullptr, nullptr), B_OK);
    EXPECT_EQ(field, "mask");
    ASSERT_EQ(message.GetInfo(3, &field, nullptr, nullptr), B_OK);
    EXPECT_EQ(field, "observable");
}

TEST(ObservableTest, TemplateCodeReplacesObup)
{
    Observable observable;
    RecordingTarget target;
    Message templateMessage(kTemplateCode);
    templateMessage.AddString("label", "levels");
    observable.Subscribe(&target, 1, &templateMessage);

    observable.Notify(1);

    ASSERT_EQ(target.received.size(), 1u);
    const Message& message = target.received[0];
    EXPECT_EQ(message.what, kTemplateCode);
    std::string label;
    EXPECT_EQ(message.FindString("label", &label), B_OK);
    EXPECT_EQ(label, "levels");
    EXPECT_EQ(MaskOf(message), 1);
}

TEST(ObservableTest, TemplateIsCopiedAtSubscription)
{
    Observable observable;
    RecordingTarget target;
    auto templateMessage = std::make_unique<Message>(kTemplateCode);
    templateMessage->AddInt32("generation", 1);
    ObserverHandle* handle = observable.Subscribe(&target, 1, templateMessage.get());
    ASSERT_NE(handle->Template(), nullptr);
    EXPECT_NE(handle->Template(), templateMessage.get());

    // Later changes to the caller's message, or its end, change nothing.
    templateMessage->what = kMsgStop;
    templateMessage->AddInt32("generation", 2);
    templateMessage.reset();
    observable.Notify(1);
    observable.Notify(1);

    ASSERT_EQ(target.received.size(), 2u);
    for (const Message& message : target.received) {
        EXPECT_EQ(message.what, kTemplateCode);
        EXPECT_EQ(message.CountValues("generation"), 1);
        // Each notification starts from the template afresh.
        EXPECT_EQ(message.CountValues("mask"), 1);
    }
}

TEST(ObservableTest, DataFieldsAlreadyInTheTemplateAreNotDuplicated)
{
    Observable observable;
    RecordingTarget target;
    Message templateMessage(kTemplateCode);
    templateMessage.AddInt32("channel", 1);
    observable.Subscribe(&target, 1, &templateMessage);
    Message data(kMsgSimpleData);
    data.AddInt32("channel", 7);
    data.AddInt32("channel", 8);
    data.AddBool("muted", true);

    observable.Notify(1, &data);

    ASSERT_EQ(target.received.size(), 1u);
    const Message& message = target.received[0];
    EXPECT_EQ(message.CountValues("channel"), 1);
    int32_t channel = 0;
    EXPECT_EQ(message.FindInt32("channel", &channel), B_OK);
    EXPECT_EQ(channel, 1);
    bool muted = false;
    EXPECT_EQ(message.FindBool("muted", &muted), B_OK);
    EXPECT_TRUE(muted);
}

TEST(ObservableTest, HandlerIsPostedToInItsThread)
{
    Observable observable;
    RecordingHandler handler;
    Message templateMessage(kTemplateCode);
    ObserverHandle* handle = observable.Subscribe(&handler, 0x5, &templateMessage);
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(handle->HandlerOf(), &handler);
    EXPECT_EQ(handle->TargetOf(), nullptr);

    observable.Notify(0x4);
    EXPECT_TRUE(handler.received.empty());  // posted, not called
    QCoreApplication::processEvents();

    ASSERT_EQ(handler.received.size(), 1u);
    EXPECT_EQ(handler.received[0].what, kTemplateCode);
    EXPECT_EQ(MaskOf(handler.received[0]), 0x4);
    Observable* source = nullptr;
    EXPECT_EQ(handler.received[0].FindPointer("observable", &source), B_OK);
    EXPECT_EQ(source, &observable);
}

TEST(ObservableTest, HandlerInNoThreadGetsNothing)
{
    Observable observable;
    RecordingHandler handler;
    observable.Subscribe(&handler, 1);
    handler.moveToThread(nullptr);
    observable.Notify(1);
    // Back in this thread, nothing was waiting for it.
    handler.moveToThread(QThread::currentThread());
    QCoreApplication::processEvents();
    EXPECT_TRUE(handler.received.empty());
    observable.Notify(1);
    QCoreApplication::processEvents();
    EXPECT_EQ(handler.received.size(), 1u);
}

TEST(ObservableTest, UnsubscribedHandleIsToldNoMore)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver a("a", &log);
    LoggingObserver b("b", &log);
    ObserverHandle* first = observable.Subscribe(&a, 1);
    observable.Subscribe(&b, 1);
    observable.Unsubscribe(first);
    EXPECT_EQ(observable.CountSubscriptions(), 1);
    observable.Notify(1);
    EXPECT_EQ(Names(log), std::vector<std::string>({"b"}));
}

TEST(ObservableTest, HandleOfAnotherObservableIsNotDeleted)
{
    Observable mine;
    Observable theirs;
    std::vector<Call> log;
    LoggingObserver observer("o", &log);
    mine.Subscribe(&observer, 1);
    ObserverHandle* foreign = theirs.Subscribe(&observer, 1);

    mine.Unsubscribe(foreign);
    mine.Unsubscribe(static_cast<ObserverHandle*>(nullptr));

    EXPECT_EQ(mine.CountSubscriptions(), 1);
    EXPECT_EQ(theirs.CountSubscriptions(), 1);
    // Still alive and still subscribed (AddressSanitizer would see a use
    // after free here otherwise).
    EXPECT_EQ(foreign->ObserverOf(), &observer);
    theirs.Notify(1);
    ASSERT_EQ(log.size(), 1u);
    EXPECT_EQ(log[0].source, &theirs);
}

TEST(ObservableTest, UnsubscribingAnObserverRemovesAllItsSubscriptions)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver leaving("leaving", &log);
    LoggingObserver staying("staying", &log);
    RecordingTarget target;
    observable.Subscribe(&leaving, 1);
    observable.Subscribe(&staying, 1);
    observable.Subscribe(&leaving, 2);
    observable.Subscribe(&target, 1);
    observable.Subscribe(&leaving, 3);

    observable.Unsubscribe(&leaving);

    EXPECT_EQ(observable.CountSubscriptions(), 2);
    observable.Notify(3);
    EXPECT_EQ(Names(log), std::vector<std::string>({"staying"}));
    EXPECT_EQ(target.received.size(), 1u);
}

TEST(ObservableTest, ObserverMayUnsubscribeItselfWhileNotified)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver once("once", &log);
    LoggingObserver after("after", &log);
    once.reaction = [&] { observable.Unsubscribe(&once); };
    observable.Subscribe(&once, 1);
    observable.Subscribe(&after, 1);

    observable.Notify(1);
    observable.Notify(1);

    EXPECT_EQ(Names(log), std::vector<std::string>({"once", "after", "after"}));
    EXPECT_EQ(observable.CountSubscriptions(), 1);
}

TEST(ObservableTest, ObserverMayUnsubscribeItsOwnHandleWhileNotified)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver once("once", &log);
    ObserverHandle* handle = observable.Subscribe(&once, 1);
    once.reaction = [&] { observable.Unsubscribe(handle); };
    observable.Notify(1);
    observable.Notify(1);
    EXPECT_EQ(Names(log), std::vector<std::string>({"once"}));
    EXPECT_EQ(observable.CountSubscriptions(), 0);
}

TEST(ObservableTest, SubscriptionRemovedByAnEarlierOneIsNotTold)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver first("first", &log);
    LoggingObserver second("second", &log);
    LoggingObserver third("third", &log);
    observable.Subscribe(&first, 1);
    ObserverHandle* secondHandle = observable.Subscribe(&second, 1);
    observable.Subscribe(&third, 1);
    first.reaction = [&] {
        observable.Unsubscribe(secondHandle);
        observable.Unsubscribe(&first);
    };

    observable.Notify(1);

    EXPECT_EQ(Names(log), std::vector<std::string>({"first", "third"}));
    EXPECT_EQ(observable.CountSubscriptions(), 1);
}

TEST(ObservableTest, SubscriptionMadeWhileNotifyingStartsWithTheNextNotify)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver recruiter("recruiter", &log);
    LoggingObserver recruit("recruit", &log);
    // Enough new subscriptions to make the list grow its storage meanwhile.
    recruiter.reaction = [&] {
        for (int i = 0; i < 20; i++)
            observable.Subscribe(&recruit, 1);
        recruiter.reaction = nullptr;
    };
    observable.Subscribe(&recruiter, 1);

    observable.Notify(1);
    EXPECT_EQ(Names(log), std::vector<std::string>({"recruiter"}));
    log.clear();
    observable.Notify(1);
    EXPECT_EQ(log.size(), 21u);
}

TEST(ObservableTest, NestedNotifyWithRemovalsKeepsTheOuterWalkValid)
{
    Observable observable;
    std::vector<Call> log;
    LoggingObserver outer("outer", &log);
    LoggingObserver inner("inner", &log);
    LoggingObserver last("last", &log);
    outer.reaction = [&] {
        outer.reaction = nullptr;
        observable.Notify(2);  // reaches inner, which removes itself
    };
    inner.reaction = [&] { observable.Unsubscribe(&inner); };
    observable.Subscribe(&outer, 1);
    observable.Subscribe(&inner, 2);
    observable.Subscribe(&last, 3);

    observable.Notify(3);

    EXPECT_EQ(Names(log), std::vector<std::string>({"outer", "inner", "last", "last"}));
    EXPECT_EQ(observable.CountSubscriptions(), 2);
}

TEST(ObservableTest, DestroyingTheObservableLeavesSubscribersAlone)
{
    std::vector<Call> log;
    LoggingObserver observer("o", &log);
    RecordingTarget target;
    {
        Observable observable;
        Message templateMessage(kTemplateCode);
        observable.Subscribe(&observer, 1);
        observable.Subscribe(&target, 1, &templateMessage);
    }
    EXPECT_TRUE(log.empty());
    EXPECT_TRUE(target.received.empty());
}

}  // namespace
}  // namespace glimmet
