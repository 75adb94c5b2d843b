#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "BatchTestSupport.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet::test {
namespace {

using LoadRefusalBatchTest = BatchTest;

TEST_F(LoadRefusalBatchTest, AFileTooLargeForMemoryIsReportedAndTheWindowKeepsItsDocument)
{
    const auto kept = fixture_.MakeSound("kept.wav", 2, 1000);
    // A minute of eight channels of silence: 42 MB of samples in a few KB.
    const auto large = fixture_.Dir() / "large.flac";
    ASSERT_EQ(std::system(("ffmpeg -nostdin -v error -y -f lavfi -i anullsrc=r=44100:cl=7.1 -t 60 -c:a flac '"
                           + large.string() + "'")
                              .c_str()),
              0);
    setenv("GLIMMET_MEMORY_LIMIT", "4000000", 1);
    DiagnosticsCapture errors(Diagnostics::Channel::Error);
    // An edit first, so that a replaced document would also lose its history.
    const int result = Run("open " + kept.string() + "\nSALL\nrvph\nprint\nopen " + large.string() + "\nprint\n");
    unsetenv("GLIMMET_MEMORY_LIMIT");
    ASSERT_EQ(result, BatchRunner::kSucceeded) << Errors();
    const std::vector<std::string> states = Lines(Output());
    ASSERT_EQ(states.size(), 2u);
    EXPECT_EQ(states[1], states[0]);
    EXPECT_NE(states[1].find("kept.wav"), std::string::npos) << states[1];
    const std::string text = errors.Finish();
    EXPECT_NE(text.find("cannot open " + large.string()), std::string::npos) << text;
    EXPECT_NE(text.find("42 MB"), std::string::npos) << text;
}

}  // namespace
}  // namespace glimmet::test
