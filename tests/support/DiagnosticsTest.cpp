#include <gtest/gtest.h>

#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <string>
#include <thread>
#include <vector>

#include "support/Diagnostics.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

// Points a file descriptor (1 or 2) at a pipe while it lives, so that what
// really reaches the process's standard output or error can be read back.
class DescriptorTap {
public:
    explicit DescriptorTap(int descriptor) : descriptor_(descriptor)
    {
        std::fflush(nullptr);
        saved_ = dup(descriptor_);
        if (pipe(ends_) != 0 || saved_ < 0 || dup2(ends_[1], descriptor_) < 0)
            ADD_FAILURE() << "cannot redirect descriptor " << descriptor_;
    }

    ~DescriptorTap() { Restore(); }

    /// Puts the descriptor back and returns everything written meanwhile.
    std::string Read()
    {
        Restore();
        std::string text;
        char chunk[256];
        ssize_t count;
        while ((count = read(ends_[0], chunk, sizeof chunk)) > 0)
            text.append(chunk, size_t(count));
        return text;
    }

private:
    void Restore()
    {
        if (saved_ < 0)
            return;
        std::fflush(nullptr);
        dup2(saved_, descriptor_);
        close(saved_);
        close(ends_[1]);
        saved_ = -1;
    }

    int descriptor_;
    int saved_ = -1;
    int ends_[2] = {-1, -1};
};

TEST(DiagnosticsTest, CaptureCollectsWhatIsPrinted)
{
    DiagnosticsCapture capture;
    Diagnostics::Print("what the....?\n");
    Diagnostics::Print("Error doing undo: %s\n", "Operation not allowed");
    EXPECT_EQ(capture.Text(), "what the....?\nError doing undo: Operation not allowed\n");
    EXPECT_EQ(capture.Finish(), "what the....?\nError doing undo: Operation not allowed\n");
}

TEST(DiagnosticsTest, FormatsLikePrintf)
{
    DiagnosticsCapture capture;
    const long long big = -9007199254740993LL;
    Diagnostics::Print("%s|%lld|%5.2f|%lx|%c%%\n", "text", big, 3.14159, 0x80004100ul, 'z');
    Diagnostics::Print("%s", "no newline");
    Diagnostics::Print("%s", "");
    EXPECT_EQ(capture.Finish(), "text|-9007199254740993| 3.14|80004100|z%\nno newline");
}

TEST(DiagnosticsTest, LongTextIsCollectedWhole)
{
    const std::string line(10000, 'x');
    DiagnosticsCapture capture;
    Diagnostics::Print("%s\n", line.c_str());
    EXPECT_EQ(capture.Finish(), line + "\n");
}

TEST(DiagnosticsTest, NestedCapturesEachCollectWhileTheyLive)
{
    DiagnosticsCapture outer;
    Diagnostics::Print("one\n");
    {
        DiagnosticsCapture inner;
        Diagnostics::Print("two\n");
        EXPECT_EQ(inner.Finish(), "two\n");
    }
    Diagnostics::Print("three\n");
    EXPECT_EQ(outer.Finish(), "one\ntwo\nthree\n");
}

TEST(DiagnosticsTest, NothingIsCollectedAfterTheCaptureEnds)
{
    DiagnosticsCapture capture;
    Diagnostics::Print("before\n");
    EXPECT_EQ(capture.Finish(), "before\n");

    DescriptorTap tap(1);
    Diagnostics::Print("after\n");
    EXPECT_EQ(capture.Text(), "before\n");
    EXPECT_EQ(capture.Finish(), "before\n");
    EXPECT_EQ(tap.Read(), "after\n");
}

TEST(DiagnosticsTest, CaptureCollectsFromOtherThreads)
{
    DiagnosticsCapture capture;
    std::thread printer([] { Diagnostics::Print("no buffer!\n"); });
    printer.join();
    EXPECT_EQ(capture.Finish(), "no buffer!\n");
}

TEST(DiagnosticsTest, LinesFromManyThreadsArriveWhole)
{
    constexpr int kThreads = 4;
    constexpr int kLines = 500;
    DiagnosticsCapture capture;
    std::vector<std::thread> printers;
    for (int t = 0; t < kThreads; ++t) {
        printers.emplace_back([t] {
            for (int i = 0; i < kLines; ++i)
                Diagnostics::Print("thread %d line %04d\n", t, i);
        });
    }
    // Captures coming and going meanwhile must not disturb the outer one.
    for (int i = 0; i < 100; ++i) {
        DiagnosticsCapture passing;
        Diagnostics::Print("main %d\n", i);
    }
    for (std::thread& printer : printers)
        printer.join();
    const std::string text = capture.Finish();

    std::vector<int> next(kThreads, 0);
    int mainLines = 0;
    size_t start = 0;
    while (start < text.size()) {
        const size_t end = text.find('\n', start);
        ASSERT_NE(end, std::string::npos);
        const std::string line = text.substr(start, end - start);
        int t = -1;
        int i = -1;
        if (std::sscanf(line.c_str(), "thread %d line %d", &t, &i) == 2) {
            ASSERT_GE(t, 0);
            ASSERT_LT(t, kThreads);
            EXPECT_EQ(i, next[size_t(t)]) << line;
            next[size_t(t)] = i + 1;
            char expected[64];
            std::snprintf(expected, sizeof expected, "thread %d line %04d", t, i);
            EXPECT_EQ(line, expected);
        } else {
            EXPECT_EQ(line, "main " + std::to_string(mainLines));
            ++mainLines;
        }
        start = end + 1;
    }
    EXPECT_EQ(next, std::vector<int>(kThreads, kLines));
    EXPECT_EQ(mainLines, 100);
}

TEST(DiagnosticsTest, WithoutACaptureTheTextReachesStandardOutput)
{
    DescriptorTap tap(1);
    Diagnostics::Print("error writing file. (%s)\n", "No such file or directory");
    EXPECT_EQ(tap.Read(), "error writing file. (No such file or directory)\n");
}

TEST(DiagnosticsTest, ACaptureMayPassTheTextOn)
{
    DescriptorTap tap(1);
    DiagnosticsCapture capture(Diagnostics::Channel::Output, DiagnosticsCapture::PassOn::Yes);
    Diagnostics::Print("Error releasing tracks: %s\n", "Is a directory");
    EXPECT_EQ(capture.Finish(), "Error releasing tracks: Is a directory\n");
    EXPECT_EQ(tap.Read(), "Error releasing tracks: Is a directory\n");
}

TEST(DiagnosticsTest, ErrorsGoToStandardErrorAndTheirOwnCapture)
{
    {
        DescriptorTap output(1);
        DescriptorTap error(2);
        Diagnostics::PrintError("stretch %d\n", 2);
        EXPECT_EQ(error.Read(), "stretch 2\n");
        EXPECT_EQ(output.Read(), "");
    }

    DiagnosticsCapture outputCapture;
    DiagnosticsCapture errorCapture(Diagnostics::Channel::Error);
    Diagnostics::PrintError("to error\n");
    Diagnostics::Print("to output\n");
    EXPECT_EQ(errorCapture.Finish(), "to error\n");
    EXPECT_EQ(outputCapture.Finish(), "to output\n");
}

}  // namespace
}  // namespace glimmet
