#include <gtest/gtest.h>

#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "BatchTestSupport.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet::test {
namespace {

std::string ReadBytes(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

using SaveBatchTest = BatchTest;

TEST_F(SaveBatchTest, SavingOverAWriteProtectedFileIsRefusedAndTheEditsStayUnsaved)
{
    const auto file = fixture_.MakeSound("s.wav", 1, 100);
    const auto target = fixture_.MakeSound("protected.wav", 1, 50);
    ASSERT_EQ(chmod(target.c_str(), 0444), 0);
    const std::string before = ReadBytes(target);
    DiagnosticsCapture capture;
    ASSERT_EQ(Run("open " + file.string() + "\nSALL\nrvph\nsaveas " + target.string() + "\nprint\n"),
        BatchRunner::kSucceeded)
        << Errors();
    EXPECT_EQ(capture.Finish(), "error writing file. (Permission denied)\n");
    EXPECT_NE(LastState().find("\"saved\": false"), std::string::npos) << LastState();
    EXPECT_EQ(ReadBytes(target), before);
}

TEST_F(SaveBatchTest, SaveAsOntoAFifoLeavesTheFifo)
{
    const auto file = fixture_.MakeSound("s.wav", 1, 100);
    const std::string fifo = Path("pipe.wav");
    ASSERT_EQ(mkfifo(fifo.c_str(), 0644), 0);
    DiagnosticsCapture capture;
    ASSERT_EQ(Run("open " + file.string() + "\nSALL\nrvph\nsaveas " + fifo + "\n"), BatchRunner::kSucceeded)
        << Errors();
    EXPECT_EQ(capture.Finish(), "error writing file. (Not a regular file)\n");
    EXPECT_TRUE(std::filesystem::is_fifo(fifo));
}

TEST_F(SaveBatchTest, AnsweringYesWhenTheSaveFailsKeepsTheWindow)
{
    const auto file = fixture_.MakeSound("s.wav", 1, 100);
    DiagnosticsCapture capture;
    ASSERT_EQ(Run("open " + file.string() + "\nSALL\nrvph\n"), BatchRunner::kSucceeded) << Errors();
    // The file cannot be replaced any more, as if its disk had been mounted
    // read-only meanwhile.
    ASSERT_EQ(chmod(file.c_str(), 0444), 0);
    ASSERT_EQ(Run("answer yes\n_QRQ\nprint\n"), BatchRunner::kSucceeded) << Errors();
    EXPECT_EQ(capture.Finish(), "error writing file. (Permission denied)\n");
    EXPECT_EQ(fixture_.App().CountWindows(), 1);
    EXPECT_NE(LastState().find("\"saved\": false"), std::string::npos) << LastState();
    EXPECT_EQ(ReadWav(file)[0][5], int16_t(105));
}

}  // namespace
}  // namespace glimmet::test
