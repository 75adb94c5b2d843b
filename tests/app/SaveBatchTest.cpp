#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <QCoreApplication>

#include <csignal>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>
#include <algorithm>

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

/// Runs the program on script under a file-size limit of limitBytes, with
/// SIGXFSZ as a shell leaves it, its standard output into outputFile.
/// Returns the wait status.
int RunUnderFileSizeLimit(const std::string& script, const std::string& outputFile, rlim_t limitBytes)
{
    const std::string program = (QCoreApplication::applicationDirPath() + "/../glimmet").toStdString();
    const int output = open(outputFile.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    if (output < 0)
        return -1;
    const pid_t child = fork();
    if (child == 0) {
        std::signal(SIGXFSZ, SIG_DFL);
        rlimit limit {};
        getrlimit(RLIMIT_FSIZE, &limit);
        limit.rlim_cur = limitBytes;
        setrlimit(RLIMIT_FSIZE, &limit);
        dup2(output, STDOUT_FILENO);
        setenv("SDL_AUDIODRIVER", "dummy", 1);
        execl(program.c_str(), program.c_str(), "--batch", script.c_str(), static_cast<char*>(nullptr));
        _exit(127);
    }
    close(output);
    int status = -1;
    if (child > 0)
        waitpid(child, &status, 0);
    return status;
}

TEST(SaveProgram, AFileSizeLimitFailsTheSaveButNotTheProgram)
{
    AppFixture fixture;
    const auto file = fixture.MakeSound("long.wav", 2, 100000);
    const auto target = fixture.Dir() / "target.wav";
    { std::ofstream(target) << "the previous recording"; }
    const auto script = fixture.Dir() / "script.txt";
    { std::ofstream(script) << "open " << file.string() << "\nSALL\nrvph\nsaveas " << target.string() << "\nprint\n"; }
    const auto output = fixture.Dir() / "output.txt";
    // Far less than the 400 KB the save needs, more than the script.
    const int status = RunUnderFileSizeLimit(script.string(), output.string(), 64 * 1024);
    ASSERT_TRUE(WIFEXITED(status)) << "killed by signal " << (WIFSIGNALED(status) ? WTERMSIG(status) : 0);
    EXPECT_EQ(WEXITSTATUS(status), 0);
    const std::string printed = ReadBytes(output);
    EXPECT_NE(printed.find("error writing file. (File too large)\n"), std::string::npos) << printed;
    EXPECT_NE(printed.find("\"saved\": false"), std::string::npos) << printed;
    EXPECT_EQ(ReadBytes(target), "the previous recording");
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(fixture.Dir()))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    EXPECT_EQ(names, (std::vector<std::string>{"long.wav", "output.txt", "script.txt", "target.wav"}));
}

}  // namespace
}  // namespace glimmet::test
