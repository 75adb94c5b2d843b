#pragma once

#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

namespace glimmet::test {

/// A private temporary directory, removed with everything in it at the end,
/// where tests make their sound files with the ffmpeg and sox command lines.
class SoundFixtures {
public:
    SoundFixtures();
    ~SoundFixtures();
    SoundFixtures(const SoundFixtures&) = delete;
    SoundFixtures& operator=(const SoundFixtures&) = delete;

    const std::filesystem::path& Directory() const { return directory_; }
    std::filesystem::path PathOf(const std::string& name) const { return directory_ / name; }

    /// A deterministic, full-range interleaved test signal.
    static std::vector<int16_t> Pattern(int64_t frames, int32_t channels, int32_t seed = 0);

    /// Writes interleaved native 16-bit samples as a headerless file.
    std::filesystem::path WriteRaw(const std::string& name, const std::vector<int16_t>& samples) const;
    std::filesystem::path WriteBytes(const std::string& name, const std::string& bytes) const;

    /// Encodes the samples with the ffmpeg command line:
    /// ffmpeg -f s16le -ar rate -ac channels -i raw <arguments> name.
    /// Returns an empty path when ffmpeg failed.
    std::filesystem::path Encode(const std::string& name, const std::vector<int16_t>& samples, int32_t rate,
                                 int32_t channels, const std::string& arguments = "") const;

    /// Runs a shell command (output discarded); true when it exited with 0.
    static bool Run(const std::string& command);
    /// The file's bytes as ffmpeg's command line decodes them to
    /// interleaved signed 16-bit: the independent reference for lossy codecs.
    std::vector<int16_t> DecodeWithFFmpeg(const std::filesystem::path& file) const;

    static std::string Quote(const std::filesystem::path& path);

private:
    std::filesystem::path directory_;
};

}  // namespace glimmet::test
