#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "AppTestSupport.h"
#include "BatchTestSupport.h"
#include "app/ScriptCommandTable.h"
#include "edit/vocoder/VocoderState.h"
#include "edit/vocoder/VocoderStretch.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet::test {
namespace {

constexpr int kFrames = 60000;

std::vector<std::vector<int16_t>> Chord()
{
    std::vector<std::vector<int16_t>> channels(2, std::vector<int16_t>(kFrames));
    for (int f = 0; f < kFrames; f++) {
        channels[0][size_t(f)] = int16_t(std::lround(8000.0 * std::sin(f * 0.0627)));
        channels[1][size_t(f)] = int16_t(std::lround(6000.0 * std::sin(f * 0.0941)));
    }
    return channels;
}

// One channel stretched as the action does it, the vocoder's memory going
// on from the previous call.
std::vector<int16_t> Stretched(const std::vector<int16_t>& range, int n, int d, int dec, int hop, float factor)
{
    std::vector<float> input(range.size());
    for (size_t i = 0; i < range.size(); i++)
        input[i] = float(range[i]) / 32768.0f;
    const int64_t length = int64_t(float(int64_t(range.size())) * factor);
    std::vector<float> output(static_cast<size_t>(length + 1), 0.0f);
    VocoderStretch::Stretch(input.data(), int64_t(input.size()), output.data(), length + 1, n, d, hop,
        float(dec), factor, 0.0f);
    std::vector<int16_t> samples(static_cast<size_t>(length));
    for (size_t i = 0; i < samples.size(); i++)
        samples[i] = int16_t(uint16_t(int64_t(output[i] * 32767.0f) & 0xFFFF));
    return samples;
}

class StretchBatchTest : public BatchTest {
protected:
    void SetUp() override { VocoderState::Shared().Reset(); }
    void TearDown() override { VocoderState::Shared().Reset(); }

    std::string Open()
    {
        const std::filesystem::path file = fixture_.Dir() / "chord.wav";
        WriteWav(file, Chord());
        return "open " + file.string() + "\nSALL\n";
    }
};

TEST(StretchScriptParse, QuotedWordsKeepTheirBlanks)
{
    std::string name;
    ScriptCommandTable::Arguments arguments;
    ASSERT_TRUE(ScriptCommandTable::Parse("field \"Stretch factor:\"  1.5", &name, &arguments));
    EXPECT_EQ(name, "field");
    EXPECT_EQ(arguments, (ScriptCommandTable::Arguments{"Stretch factor:", "1.5"}));
    ASSERT_TRUE(ScriptCommandTable::Parse("  curve click 0.5 0.25 ", &name, &arguments));
    EXPECT_EQ(arguments, (ScriptCommandTable::Arguments{"click", "0.5", "0.25"}));
    ASSERT_TRUE(ScriptCommandTable::Parse("field \"FFT length:\" \"\"", &name, &arguments));
    EXPECT_EQ(arguments, (ScriptCommandTable::Arguments{"FFT length:", ""}));
}

TEST_F(StretchBatchTest, DialogLineListsTheFieldsInOrder)
{
    ASSERT_EQ(Run(Open() + "tstr\ndialog\nfield \"Stretch factor:\" 1.5\nfield \"FFT length:\" 12abc\ndialog\n"
                           "cancel\ndialog\n"),
        BatchRunner::kSucceeded)
        << Errors();
    const auto lines = Lines(Output());
    ASSERT_EQ(lines.size(), 3u);
    EXPECT_EQ(lines[0], "{\"title\": \"Time Stretch\", \"fields\": {\"FFT length:\": \"8192\", "
                        "\"Window size in samples:\": \"8192\", \"Decimation factor in samples:\": \"2048\", "
                        "\"Interpolation factor in samples:\": \"2048\", \"Stretch factor:\": \"2.0\", "
                        "\"Oscillator bank pitch factor:\": \"0.0\", "
                        "\"Oscillator resynthesis gate threshold:\": \"0.0\"}}");
    EXPECT_NE(lines[1].find("\"FFT length:\": \"12abc\""), std::string::npos) << lines[1];
    EXPECT_NE(lines[1].find("\"Stretch factor:\": \"1.5\""), std::string::npos) << lines[1];
    EXPECT_EQ(lines[2], "{\"title\": null}");
}

TEST_F(StretchBatchTest, FieldNeedsAnOpenDialogAndAKnownLabel)
{
    EXPECT_EQ(Run("field \"Stretch factor:\" 1.5\n"), BatchRunner::kFailed);
    EXPECT_EQ(Run("tstr\nfield \"Nonsense:\" 1\n"), BatchRunner::kFailed);
    EXPECT_NE(Errors().find("no field labelled \"Nonsense:\""), std::string::npos) << Errors();
    EXPECT_EQ(Run("cancel\nfltr\nfield \"Stretch factor:\" 1\n"), BatchRunner::kFailed);
}

TEST_F(StretchBatchTest, OkWaitsForTheStretchAndWritesBothChannels)
{
    DiagnosticsCapture out(Diagnostics::Channel::Output), err(Diagnostics::Channel::Error);
    ASSERT_EQ(Run(Open() + "tstr\nfield \"Decimation factor in samples:\" 0\nfield \"FFT length:\" 4096\n"
                           "field \"Stretch factor:\" 1.5\nok\ndialog\nsamples 0 " + Path("s0.raw") + "\nsamples 1 "
                  + Path("s1.raw") + "\nundo\nprint\n"),
        BatchRunner::kSucceeded)
        << Errors();
    const std::string printed = out.Finish();
    EXPECT_NE(printed.find("stretch on buffer[0] done!\n"), std::string::npos) << printed;
    EXPECT_NE(printed.find("stretch on buffer[1] done!\n"), std::string::npos) << printed;
    EXPECT_NE(printed.find("Error doing undo"), std::string::npos) << printed;
    EXPECT_EQ(err.Finish(), "STRETCH DONE\nSTRETCH DONE\n");
    EXPECT_EQ(Lines(Output())[0], "{\"title\": null}");
    EXPECT_NE(LastState().find("\"undo\": null"), std::string::npos) << LastState();
    VocoderState::Shared().Reset();
    DiagnosticsCapture quietOut, quietErr(Diagnostics::Channel::Error);
    const auto chord = Chord();
    const std::vector<int16_t> first = Stretched(chord[0], 4096, 8192, 0, 2048, 1.5f);
    const std::vector<int16_t> second = Stretched(chord[1], 4096, 8192, 0, 2048, 1.5f);
    EXPECT_EQ(ReadRaw(fixture_.Dir() / "s0.raw"), first);
    EXPECT_EQ(ReadRaw(fixture_.Dir() / "s1.raw"), second);
    EXPECT_EQ(first.size(), 90000u);
}

TEST_F(StretchBatchTest, CloseBoxCancels)
{
    ASSERT_EQ(Run(Open() + "tstr\nclose\ndialog\nprint\n"), BatchRunner::kSucceeded) << Errors();
    EXPECT_EQ(Lines(Output())[0], "{\"title\": null}");
    EXPECT_NE(LastState().find("\"undo\": null"), std::string::npos) << LastState();
}

}  // namespace
}  // namespace glimmet::test
