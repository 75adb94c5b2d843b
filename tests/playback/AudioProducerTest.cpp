#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>

#include "AllocationCounter.h"
#include "PlaybackTestSupport.h"
#include "playback/AudioProducer.h"
#include "playback/MediaKit.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

using test::ChannelRecipe;
using test::FakePlaybackWindow;
using test::ReferencePlayback;

constexpr int32_t kNode = 7;
constexpr MediaSource kOurSource{kNode, 0};
constexpr MediaDestination kDevice{42, 0};

MediaFormat RawFloat(uint32_t bufferSize = kWildcardBufferSize)
{
    MediaFormat format;
    format.type = B_MEDIA_RAW_AUDIO;
    format.frameRate = 44100;
    format.channelCount = 2;
    format.sampleFormat = B_AUDIO_FLOAT;
    format.byteOrder = B_MEDIA_LITTLE_ENDIAN;
    format.bufferSize = bufferSize;
    return format;
}

std::vector<ChannelRecipe> SmallDocument(int64_t length)
{
    std::mt19937 random(5);
    std::vector<ChannelRecipe> channels;
    channels.push_back({test::RandomSamples(random, length, 100, 3000), 0, 0, false});
    channels.push_back({test::RandomSamples(random, length - 40, -3000, 3000), 40, -128, false});
    channels.push_back({test::RandomSamples(random, length, -3000, 3000), 0, 127, false});
    return channels;
}

// A producer with a document, negotiated and connected as the graph does it,
// but served by hand instead of by a device.
class ProducerTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        manager = std::make_unique<ChannelManager>(&window);
        producer = std::make_unique<AudioProducer>(manager.get(), &window);
        producer->NodeRegistered(kNode);
    }

    void Connect(int64_t downstreamLatency = 5804)
    {
        MediaFormat format = RawFloat();
        MediaSource source;
        char name[kMediaNameLength] = {};
        DiagnosticsCapture capture;
        ASSERT_EQ(producer->PrepareToConnect(kOurSource, kDevice, &format, &source, name), B_OK);
        producer->Connect(B_OK, source, kDevice, format, name, downstreamLatency);
        connectOutput = capture.Finish();
    }

    /// One device period served at deviceFrame; returns its floats.
    std::vector<float> Serve(int64_t deviceFrame)
    {
        std::vector<float> out(test::kBufferFrames * 2, -9.0f);
        producer->ServeDevice(out.data(), int32_t(test::kBufferFrames), deviceFrame);
        return out;
    }

    FakePlaybackWindow window;
    std::unique_ptr<ChannelManager> manager;
    std::unique_ptr<AudioProducer> producer;
    std::string connectOutput;
};

TEST_F(ProducerTest, IsNamedAndRegisteredAsARealTimeNodeWithOneOutput)
{
    EXPECT_STREQ(producer->Name(), "Glimmet");
    EXPECT_EQ(producer->Priority(), 120);
    EXPECT_TRUE(producer->IsLoopRunning());
    EXPECT_EQ(producer->AddOn(nullptr), nullptr);
    MediaOutput output;
    int32_t cookie = 0;
    ASSERT_EQ(producer->GetNextOutput(&cookie, &output), B_OK);
    EXPECT_EQ(cookie, 1);
    EXPECT_STREQ(output.name, "Quillex Sound Output");
    EXPECT_EQ(output.source, kOurSource);
    EXPECT_EQ(output.node, kNode);
    EXPECT_EQ(output.destination, MediaDestination::Null());
    EXPECT_EQ(output.format, producer->PreferredFormat());
    EXPECT_EQ(producer->GetNextOutput(&cookie, &output), B_BAD_INDEX);
    EXPECT_EQ(producer->DisposeOutputCookie(cookie), B_OK);
}

TEST_F(ProducerTest, PrefersStereoFloatAt44100WithTheBufferSizeLeftOpen)
{
    const MediaFormat& preferred = producer->PreferredFormat();
    EXPECT_EQ(preferred.type, B_MEDIA_RAW_AUDIO);
    EXPECT_EQ(preferred.frameRate, 44100.0f);
    EXPECT_EQ(preferred.channelCount, 2u);
    EXPECT_EQ(preferred.sampleFormat, B_AUDIO_FLOAT);
    EXPECT_EQ(preferred.byteOrder, B_MEDIA_LITTLE_ENDIAN);
    EXPECT_EQ(preferred.bufferSize, kWildcardBufferSize);
    EXPECT_EQ(producer->RunMode(), B_INCREASE_LATENCY);
    EXPECT_EQ(producer->InternalLatency(), 0);
    EXPECT_EQ(producer->DownstreamLatency(), 0);
    EXPECT_EQ(producer->FramesSent(), 0);
    EXPECT_EQ(producer->StartTime(), 0);
}

TEST_F(ProducerTest, SuggestsItsFormatForRawOrUnknownTypesOnly)
{
    MediaFormat format;
    EXPECT_EQ(producer->FormatSuggestionRequested(B_MEDIA_UNKNOWN_TYPE, 0, &format), B_OK);
    EXPECT_EQ(format, producer->PreferredFormat());
    EXPECT_EQ(producer->FormatSuggestionRequested(B_MEDIA_RAW_AUDIO, 0, &format), B_OK);
    format = MediaFormat();
    EXPECT_EQ(producer->FormatSuggestionRequested(B_MEDIA_ENCODED_AUDIO, 0, &format), B_MEDIA_BAD_FORMAT);
    EXPECT_EQ(format, producer->PreferredFormat());

    DiagnosticsCapture capture;
    EXPECT_EQ(producer->FormatSuggestionRequested(B_MEDIA_RAW_AUDIO, 0, nullptr), B_BAD_VALUE);
    EXPECT_EQ(capture.Finish(), "\tERROR - NULL format pointer passed in!\n");
}

TEST_F(ProducerTest, ProposalOfANonRawTypeIsRefusedWithThePreferredFormatWrittenIn)
{
    MediaFormat format;
    format.type = B_MEDIA_ENCODED_AUDIO;
    format.frameRate = 8000;
    DiagnosticsCapture capture;
    EXPECT_EQ(producer->FormatProposal(kOurSource, &format), B_MEDIA_BAD_FORMAT);
    EXPECT_EQ(capture.Finish(), "AudioProducer::FormatProposal returning B_MEDIA_BAD_FORMAT\n");
    EXPECT_EQ(format, producer->PreferredFormat());
}

TEST_F(ProducerTest, ProposalOfRawOrUnknownIsAnsweredWithThePreferredFormat)
{
    for (int32_t type : {B_MEDIA_UNKNOWN_TYPE, B_MEDIA_RAW_AUDIO}) {
        MediaFormat format;
        format.type = type;
        format.channelCount = 6;
        DiagnosticsCapture capture;
        EXPECT_EQ(producer->FormatProposal(kOurSource, &format), B_OK);
        EXPECT_EQ(capture.Finish(), "");
        EXPECT_EQ(format, producer->PreferredFormat());
    }
}

TEST_F(ProducerTest, ProposalForAForeignSourceIsRefused)
{
    MediaFormat format = RawFloat();
    DiagnosticsCapture capture;
    EXPECT_EQ(producer->FormatProposal(MediaSource{kNode + 1, 0}, &format), B_MEDIA_BAD_SOURCE);
    EXPECT_EQ(capture.Finish(), "AudioProducer::FormatProposal returning B_MEDIA_BAD_SOURCE\n");
    EXPECT_EQ(format, RawFloat());
}

TEST_F(ProducerTest, AnOpenBufferSizeBecomes2048Bytes)
{
    MediaFormat format = RawFloat();
    MediaSource source;
    char name[kMediaNameLength] = {};
    DiagnosticsCapture capture;
    ASSERT_EQ(producer->PrepareToConnect(kOurSource, kDevice, &format, &source, name), B_OK);
    EXPECT_EQ(capture.Finish(), "\tno buffer size provided, suggesting 2048\n");
    EXPECT_EQ(format.bufferSize, 2048u);
    EXPECT_EQ(source, kOurSource);
    EXPECT_STREQ(name, "Quillex Sound Output");
    EXPECT_EQ(producer->Output().destination, kDevice);
    // The connection is reserved now.
    MediaFormat again = RawFloat();
    EXPECT_EQ(producer->PrepareToConnect(kOurSource, kDevice, &again, &source, name), B_MEDIA_ALREADY_CONNECTED);
}

TEST_F(ProducerTest, ASuggestedBufferSizeIsTaken)
{
    MediaFormat format = RawFloat(4096);
    format.frameRate = 48000;
    format.channelCount = 2;
    MediaSource source;
    char name[kMediaNameLength] = {};
    DiagnosticsCapture capture;
    ASSERT_EQ(producer->PrepareToConnect(kOurSource, kDevice, &format, &source, name), B_OK);
    EXPECT_EQ(capture.Finish(), "\tconsumer suggested buffer_size 4096\n");
    EXPECT_EQ(format.bufferSize, 4096u);
    EXPECT_EQ(producer->Output().format.frameRate, 48000.0f);
}

TEST_F(ProducerTest, NonRawAndNonFloatFormatsAreRefusedWhenConnecting)
{
    MediaSource source;
    char name[kMediaNameLength] = {};
    MediaFormat encoded = RawFloat();
    encoded.type = B_MEDIA_ENCODED_AUDIO;
    DiagnosticsCapture capture;
    EXPECT_EQ(producer->PrepareToConnect(kOurSource, kDevice, &encoded, &source, name), B_MEDIA_BAD_FORMAT);
    EXPECT_EQ(capture.Finish(), "\tnon-raw-audio format?!\n");

    MediaFormat shorts = RawFloat();
    shorts.sampleFormat = B_AUDIO_SHORT;
    DiagnosticsCapture secondCapture;
    EXPECT_EQ(producer->PrepareToConnect(kOurSource, kDevice, &shorts, &source, name), B_MEDIA_BAD_FORMAT);
    EXPECT_EQ(secondCapture.Finish(), "\tnon-float-audio format?!\n");

    MediaFormat fine = RawFloat();
    EXPECT_EQ(producer->PrepareToConnect(MediaSource{3, 3}, kDevice, &fine, &source, name), B_MEDIA_BAD_SOURCE);
    EXPECT_EQ(producer->Output().destination, MediaDestination::Null());
}

TEST_F(ProducerTest, ConnectingMeasuresATrialMixThatMovesThePlayPositionOneBuffer)
{
    test::AddChannels(manager.get(), SmallDocument(5000));
    manager->SetCurrentFrame(1000);
    Connect(5804);
    EXPECT_EQ(manager->CurrentFrame(), 1000 + test::kBufferFrames);
    const std::string negotiation = "\tno buffer size provided, suggesting 2048\n";
    const std::string prefix = negotiation + "\tbuffer-filling took ";
    ASSERT_EQ(connectOutput.rfind(prefix, 0), 0u) << connectOutput;
    const int64_t printed = std::stoll(connectOutput.substr(prefix.size()));
    EXPECT_EQ(printed, producer->InternalLatency());
    EXPECT_EQ(connectOutput, prefix + std::to_string(printed) + " usec on this machine\n");
    EXPECT_EQ(producer->EventLatency(), 5804 + producer->InternalLatency());
    // 512 floats at 88200 samples a second.
    EXPECT_EQ(producer->BufferDuration(), 5804);
    ASSERT_NE(producer->Buffers(), nullptr);
    EXPECT_EQ(producer->Buffers()->CountBuffers(), 5804 / 5804 + 2);
    EXPECT_EQ(producer->Buffers()->BufferSize(), 2048u);
    int64_t latency = 0;
    EXPECT_EQ(producer->GetLatency(&latency), B_OK);
    EXPECT_EQ(latency, producer->EventLatency() + producer->SchedulingLatency());
}

TEST_F(ProducerTest, AFailedConnectionReturnsToThePreferredFormat)
{
    MediaFormat format = RawFloat();
    MediaSource source;
    char name[kMediaNameLength] = {};
    DiagnosticsCapture capture;
    ASSERT_EQ(producer->PrepareToConnect(kOurSource, kDevice, &format, &source, name), B_OK);
    producer->Connect(B_ERROR, source, kDevice, format, name);
    EXPECT_EQ(capture.Finish(), "\tno buffer size provided, suggesting 2048\n");
    EXPECT_EQ(producer->Output().destination, MediaDestination::Null());
    EXPECT_EQ(producer->Output().format, producer->PreferredFormat());
}

TEST_F(ProducerTest, DisconnectReturnsToTheUnconnectedState)
{
    Connect();
    producer->Disconnect(kOurSource, kDevice);
    EXPECT_EQ(producer->Output().destination, MediaDestination::Null());
    EXPECT_EQ(producer->Output().format, producer->PreferredFormat());
    EXPECT_EQ(producer->Buffers(), nullptr);
}

TEST_F(ProducerTest, DisconnectOfAForeignConnectionIsReportedAndChangesNothing)
{
    Connect();
    DiagnosticsCapture capture;
    producer->Disconnect(MediaSource{kNode, 3}, MediaDestination{42, 9});
    EXPECT_EQ(capture.Finish(),
        "\tDisconnect() called with wrong source/destination (3/9), ours is (0/0)\n");
    EXPECT_EQ(producer->Output().destination, kDevice);
    EXPECT_NE(producer->Buffers(), nullptr);
}

TEST_F(ProducerTest, OfflineRunModeIsRefusedWithAnErrorReport)
{
    producer->SetRunMode(B_OFFLINE);
    EXPECT_EQ(producer->LastReportedError(), B_NODE_FAILED_SET_RUN_MODE);
    EXPECT_EQ(producer->RunMode(), B_INCREASE_LATENCY);
    producer->SetRunMode(B_DROP_DATA);
    EXPECT_EQ(producer->RunMode(), B_DROP_DATA);
}

TEST_F(ProducerTest, LateNoticeRaisesTheLatencyInIncreaseLatencyMode)
{
    Connect(5804);
    const int64_t internal = producer->InternalLatency();
    DiagnosticsCapture capture;
    producer->LateNoticeReceived(kOurSource, 1500, 0);
    const int64_t total = 5804 + internal + 1500;
    EXPECT_EQ(capture.Finish(), "\tincreasing latency to " + std::to_string(total) + "\n");
    EXPECT_EQ(producer->InternalLatency(), internal + 1500);
    EXPECT_EQ(producer->EventLatency(), total);
    EXPECT_EQ(producer->FramesSent(), 0);
}

TEST_F(ProducerTest, LateNoticeSkipsTwiceABufferInOtherModes)
{
    Connect();
    producer->SetRunMode(B_DROP_DATA);
    DiagnosticsCapture capture;
    producer->LateNoticeReceived(kOurSource, 1500, 0);
    EXPECT_EQ(capture.Finish(), "\tskipping a buffer to try to catch up\n");
    EXPECT_EQ(producer->FramesSent(), 512);
}

TEST_F(ProducerTest, LateNoticesAreIgnoredWhileRecordingOrForAForeignSource)
{
    Connect();
    const int64_t latency = producer->EventLatency();
    DiagnosticsCapture capture;
    producer->LateNoticeReceived(MediaSource{1, 1}, 1500, 0);
    producer->SetRunMode(B_RECORDING);
    producer->LateNoticeReceived(kOurSource, 1500, 0);
    EXPECT_EQ(capture.Finish(), "");
    EXPECT_EQ(producer->EventLatency(), latency);
    EXPECT_EQ(producer->FramesSent(), 0);
}

TEST_F(ProducerTest, LatencyChangeOfOurConnectionMovesTheEventLatency)
{
    Connect(5804);
    producer->LatencyChanged(kOurSource, kDevice, 20000, 0);
    EXPECT_EQ(producer->DownstreamLatency(), 20000);
    EXPECT_EQ(producer->EventLatency(), 20000 + producer->InternalLatency());
    producer->LatencyChanged(kOurSource, MediaDestination{1, 1}, 1, 0);
    EXPECT_EQ(producer->DownstreamLatency(), 20000);
}

TEST_F(ProducerTest, UnsupportedRequestsFail)
{
    EXPECT_EQ(producer->HandleMessage(1, nullptr, 0), B_ERROR);
    EXPECT_EQ(producer->SetPlayRate(2, 1), B_ERROR);
}

TEST_F(ProducerTest, FormatChangeChecksBothEndsAndReallocatesBuffers)
{
    Connect();
    MediaFormat bigger = RawFloat(4096);
    EXPECT_EQ(producer->FormatChangeRequested(kOurSource, MediaDestination{1, 1}, &bigger, nullptr),
        B_MEDIA_BAD_DESTINATION);
    EXPECT_EQ(producer->FormatChangeRequested(MediaSource{1, 1}, kDevice, &bigger, nullptr), B_MEDIA_BAD_SOURCE);
    EXPECT_EQ(producer->Buffers()->BufferSize(), 2048u);
    EXPECT_EQ(producer->FormatChangeRequested(kOurSource, kDevice, &bigger, nullptr), B_OK);
    EXPECT_EQ(producer->Output().format.bufferSize, 4096u);
    EXPECT_EQ(producer->Buffers()->BufferSize(), 4096u);
}

TEST_F(ProducerTest, BufferGroupIsAdoptedOrMadeWhenNoneIsGiven)
{
    Connect();
    EXPECT_EQ(producer->SetBufferGroup(MediaSource{1, 1}, nullptr), B_MEDIA_BAD_SOURCE);
    auto group = std::make_unique<BufferGroup>(2048, 5);
    const BufferGroup* given = group.get();
    EXPECT_EQ(producer->SetBufferGroup(kOurSource, std::move(group)), B_OK);
    EXPECT_EQ(producer->Buffers(), given);
    EXPECT_EQ(producer->SetBufferGroup(kOurSource, nullptr), B_OK);
    ASSERT_NE(producer->Buffers(), nullptr);
    EXPECT_EQ(producer->Buffers()->CountBuffers(), 3);
}

TEST_F(ProducerTest, StartedProducerSendsOneMixedBufferPerPeriodAndPostsThePosition)
{
    const auto channels = SmallDocument(3000);
    test::AddChannels(manager.get(), channels);
    Connect();
    manager->ResetCurrentFrame();
    producer->SetRunMode(B_RECORDING);

    // Not started: silence and no buffer.
    EXPECT_EQ(Serve(0), std::vector<float>(512, 0.0f));
    ASSERT_EQ(producer->Start(0), B_OK);
    const ReferencePlayback reference(channels, 0, true, -1, -1, 0, 0);
    const std::vector<float> expected = reference.Play(0, 3);
    for (int64_t period = 0; period < 3; period++) {
        const std::vector<float> out = Serve(test::kBufferFrames * (period + 1));
        EXPECT_TRUE(std::equal(out.begin(), out.end(), expected.begin() + period * 512)) << period;
        EXPECT_EQ(producer->FramesSent(), test::kBufferFrames * (period + 1));
    }
    EXPECT_TRUE(producer->IsStarted());
    // In recording mode the buffer is stamped with its event's time.
    EXPECT_EQ(producer->LastBufferStartTime(), std::llround(512 / 44100.0 * 1e6));

    producer->Relay().Drain();
    window.ProcessPending();
    EXPECT_EQ(window.playmarkUpdates, (std::vector<int64_t>{256, 512, 768}));

    ASSERT_EQ(producer->Stop(0, true), B_OK);
    EXPECT_EQ(Serve(test::kBufferFrames * 4), std::vector<float>(512, 0.0f));
    EXPECT_FALSE(producer->IsStarted());
}

TEST_F(ProducerTest, StartWaitsForItsPerformanceTime)
{
    test::AddChannels(manager.get(), SmallDocument(3000));
    Connect();
    // Within the second period, which plays from 5805 to 11610 microseconds.
    ASSERT_EQ(producer->Start(11000), B_OK);
    EXPECT_EQ(Serve(0), std::vector<float>(512, 0.0f));
    EXPECT_FALSE(producer->IsStarted());
    EXPECT_NE(Serve(256), std::vector<float>(512, 0.0f));
    EXPECT_TRUE(producer->IsStarted());
    EXPECT_EQ(producer->StartTime(), 11000);
}

TEST_F(ProducerTest, WhenTheMixHasNothingSilenceIsSentAndTimeGoesOn)
{
    test::AddChannels(manager.get(), SmallDocument(3000));
    Connect();
    // A play range of 100 frames is shorter than one buffer.
    manager->SetPlayMode(ChannelManager::kPlayRange);
    manager->SetRangeStart(100);
    manager->SetRangeEnd(199);
    ASSERT_EQ(producer->Start(0), B_OK);
    for (int64_t period = 0; period < 4; period++)
        EXPECT_EQ(Serve(period * test::kBufferFrames), std::vector<float>(512, 0.0f));
    EXPECT_EQ(producer->FramesSent(), 4 * test::kBufferFrames);
    producer->Relay().Drain();
    window.ProcessPending();
    EXPECT_EQ(window.playmarkUpdates, (std::vector<int64_t>{100, 100, 100, 100}));
}

TEST_F(ProducerTest, AFormatChangePreparesTheMixerForTheNewBuffers)
{
    const auto channels = SmallDocument(3000);
    test::AddChannels(manager.get(), channels);
    Connect();
    MediaFormat bigger = RawFloat(4096);
    ASSERT_EQ(producer->FormatChangeRequested(kOurSource, kDevice, &bigger, nullptr), B_OK);
    manager->ResetCurrentFrame();
    ASSERT_EQ(producer->Start(0), B_OK);
    // The device takes the first 256 of the buffer's 512 frames.
    const std::vector<float> out = Serve(0);
    const ReferencePlayback reference(channels, 0, true, -1, -1, 0, 0);
    const std::vector<float> expected = reference.Play(0, 1, 512);
    EXPECT_TRUE(std::equal(out.begin(), out.end(), expected.begin()));
    producer->Relay().Drain();
    window.ProcessPending();
    EXPECT_EQ(window.playmarkUpdates, (std::vector<int64_t>{512}));
}

TEST_F(ProducerTest, DisabledOutputSendsNothingButKeepsTime)
{
    test::AddChannels(manager.get(), SmallDocument(3000));
    Connect();
    int32_t tag = 0;
    producer->EnableOutput(kOurSource, false, &tag);
    EXPECT_FALSE(producer->IsOutputEnabled());
    ASSERT_EQ(producer->Start(0), B_OK);
    EXPECT_EQ(Serve(0), std::vector<float>(512, 0.0f));
    EXPECT_EQ(producer->FramesSent(), test::kBufferFrames);
    EXPECT_EQ(manager->CurrentFrame(), 2 * test::kBufferFrames);  // trial mix, then this buffer
    producer->EnableOutput(kOurSource, true, &tag);
    EXPECT_NE(Serve(256), std::vector<float>(512, 0.0f));
}

TEST_F(ProducerTest, WithoutABufferNothingIsMixedButTimeGoesOn)
{
    test::AddChannels(manager.get(), SmallDocument(3000));
    Connect();
    ASSERT_EQ(producer->SetBufferGroup(kOurSource, std::make_unique<BufferGroup>(2048, 0)), B_OK);
    ASSERT_EQ(producer->Start(0), B_OK);
    DiagnosticsCapture capture;
    EXPECT_EQ(Serve(0), std::vector<float>(512, 0.0f));
    EXPECT_EQ(capture.Finish(), "no buffer!\n");
    EXPECT_EQ(producer->FramesSent(), test::kBufferFrames);
    producer->Relay().Drain();
    window.ProcessPending();
    EXPECT_TRUE(window.playmarkUpdates.empty());
}

TEST_F(ProducerTest, ASkippedBufferLeavesTwoPeriodsSilent)
{
    const auto channels = SmallDocument(6000);
    test::AddChannels(manager.get(), channels);
    Connect();
    manager->ResetCurrentFrame();
    producer->SetRunMode(B_DROP_DATA);
    ASSERT_EQ(producer->Start(0), B_OK);
    EXPECT_NE(Serve(0), std::vector<float>(512, 0.0f));
    DiagnosticsCapture capture;
    producer->LateNoticeReceived(kOurSource, 3000, 0);
    capture.Finish();
    // The buffer already queued still plays; the next two periods are skipped.
    EXPECT_NE(Serve(256), std::vector<float>(512, 0.0f));
    EXPECT_EQ(Serve(512), std::vector<float>(512, 0.0f));
    EXPECT_EQ(Serve(768), std::vector<float>(512, 0.0f));
    const ReferencePlayback reference(channels, 0, true, -1, -1, 0, 0);
    const std::vector<float> third = reference.Play(0, 3);
    const std::vector<float> out = Serve(1024);
    EXPECT_TRUE(std::equal(out.begin(), out.end(), third.begin() + 1024));
    EXPECT_EQ(producer->FramesSent(), 256 * 3 + 512);
}

TEST_F(ProducerTest, ASlowPeriodRaisesALateNotice)
{
    test::AddChannels(manager.get(), SmallDocument(3000));
    Connect();
    ASSERT_EQ(producer->Start(0), B_OK);
    const int64_t internal = producer->InternalLatency();
    DiagnosticsCapture capture;
    std::thread holder([&] {
        manager->Lock();
        std::this_thread::sleep_for(std::chrono::milliseconds(30));
        manager->Unlock();
    });
    while (manager->DocumentLock().LockWithTimeout(0)) {
        manager->Unlock();
        std::this_thread::yield();
    }
    Serve(0);
    holder.join();
    const std::string printed = capture.Finish();
    EXPECT_EQ(producer->LatePeriods(), 1);
    EXPECT_GT(producer->InternalLatency(), internal + 15000);
    EXPECT_EQ(printed, "\tincreasing latency to " + std::to_string(producer->EventLatency()) + "\n");
}

TEST_F(ProducerTest, ServingPeriodsAllocatesNothing)
{
    test::AddChannels(manager.get(), SmallDocument(20000));
    Connect();
    manager->SetLoop(true);
    ASSERT_EQ(producer->Start(0), B_OK);
    std::vector<float> out(test::kBufferFrames * 2);
    {
        // The counter does see allocations.
        test::AllocationCounter counter;
        auto probe = std::make_unique<int>(1);
        EXPECT_EQ(counter.Count(), 1);
    }
    int64_t allocations = 0;
    {
        test::AllocationCounter counter;
        for (int64_t period = 0; period < 200; period++)
            producer->ServeDevice(out.data(), int32_t(test::kBufferFrames), period * test::kBufferFrames);
        allocations = counter.Count();
    }
    EXPECT_EQ(allocations, 0);
    EXPECT_EQ(producer->PeriodsServed(), 200);
    EXPECT_EQ(producer->FramesSent(), 200 * test::kBufferFrames);
    EXPECT_GE(producer->LongestPeriodMicros(), 0);
    EXPECT_LE(producer->LatePeriods(), producer->PeriodsServed());
    producer->Relay().Drain();
    window.ProcessPending();
    EXPECT_EQ(window.playmarkUpdates.size(), 200u);
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

// A range that does not loop, played on past its end by the audio thread:
// the stop travels with the play-mark updates, in the order the mix made
// them, and nothing on the way allocates.
TEST_F(ProducerTest, PlayingPastTheEndOfARangeAllocatesNothingAndRelaysOneStopInOrder)
{
    const auto channels = SmallDocument(6000);
    test::AddChannels(manager.get(), channels);
    Connect();
    manager->SetPlayMode(ChannelManager::kPlayRange);
    manager->SetLoop(false);
    // 1500 frames: five whole buffers and a sixth that ends in silence.
    manager->SetRangeStart(1000);
    manager->SetRangeEnd(2499);
    manager->ResetCurrentFrame();
    window.ProcessPending();
    window.received.clear();
    ASSERT_EQ(producer->Start(0), B_OK);

    constexpr int64_t kPeriods = 8;
    std::vector<std::vector<float>> periods(kPeriods, std::vector<float>(test::kBufferFrames * 2));
    int64_t allocations = 0;
    {
        test::AllocationCounter counter;
        for (int64_t period = 0; period < kPeriods; period++) {
            producer->ServeDevice(
                periods[size_t(period)].data(), int32_t(test::kBufferFrames), period * test::kBufferFrames);
        }
        allocations = counter.Count();
    }
    EXPECT_EQ(allocations, 0);

    producer->Relay().Drain();
    window.ProcessPending();
    // The sixth buffer reaches the end: its mix asks for the stop before its
    // update reports the position beyond the range. The two buffers after it
    // start the range again, without another stop.
    const uint32_t update = kMsgUpdatePlaymark;
    EXPECT_EQ(window.received, (std::vector<uint32_t>{update, update, update, update, update, kMsgStop, update,
                                  update, update}));
    EXPECT_EQ(window.stopMessages, 1);
    EXPECT_EQ(window.playmarkUpdates, (std::vector<int64_t>{1256, 1512, 1768, 2024, 2280, 2500, 1256, 1512}));

    const ReferencePlayback reference(channels, ChannelManager::kPlayRange, false, 1000, 2499, 0, 0);
    const std::vector<float> expected = reference.Play(0, 6);
    for (int64_t period = 0; period < 6; period++) {
        EXPECT_TRUE(std::equal(periods[size_t(period)].begin(), periods[size_t(period)].end(),
            expected.begin() + period * test::kBufferFrames * 2))
            << period;
    }
    // The sixth buffer: 220 frames of the range, then silence.
    EXPECT_TRUE(std::all_of(periods[5].begin() + 2 * 220, periods[5].end(), [](float v) { return v == 0.0f; }));
}

}  // namespace
}  // namespace glimmet
