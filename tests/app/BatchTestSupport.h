#pragma once

#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "AppTestSupport.h"
#include "app/BatchRunner.h"

namespace glimmet::test {


inline std::string ReadAll(std::FILE* file)
{
    std::fflush(file);
    std::rewind(file);
    std::string text;
    char chunk[4096];
    size_t got = 0;
    while ((got = std::fread(chunk, 1, sizeof chunk, file)) > 0)
        text.append(chunk, got);
    return text;
}

inline std::vector<std::string> Lines(const std::string& text)
{
    std::vector<std::string> lines;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line))
        lines.push_back(line);
    return lines;
}

inline std::vector<int16_t> ReadRaw(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    std::vector<int16_t> samples;
    unsigned char pair[2];
    while (in.read(reinterpret_cast<char*>(pair), 2))
        samples.push_back(int16_t(uint16_t(pair[0] | (pair[1] << 8))));
    return samples;
}

/// One document window driven by a script, with the script's output and
/// error streams captured.
class BatchTest : public ::testing::Test {
protected:
    BatchTest() : window_(fixture_.App().NewWindow()) {}
    ~BatchTest() override
    {
        if (output_ != nullptr)
            std::fclose(output_);
        if (errors_ != nullptr)
            std::fclose(errors_);
    }

    int Run(const std::string& script)
    {
        BatchRunner runner(fixture_.App(), window_, output_, errors_);
        std::istringstream in(script);
        return runner.Run(in);
    }

    std::string Output() { return ReadAll(output_); }
    std::string Errors() { return ReadAll(errors_); }
    /// The last line `print` wrote.
    std::string LastState()
    {
        const auto lines = Lines(Output());
        return lines.empty() ? std::string() : lines.back();
    }
    std::string Path(const std::string& name) const { return (fixture_.Dir() / name).string(); }

    AppFixture fixture_;
    QuillexWindow* window_;
    std::FILE* output_ = std::tmpfile();
    std::FILE* errors_ = std::tmpfile();
};

}  // namespace glimmet::test
