#include "SoundFixtures.h"

#include <cstdlib>
#include <fstream>
#include <iterator>
#include <stdexcept>

namespace glimmet::test {

SoundFixtures::SoundFixtures()
{
    std::string pattern = (std::filesystem::temp_directory_path() / "glimmet-files-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr)
        throw std::runtime_error("cannot make a temporary directory");
    directory_ = pattern;
}

SoundFixtures::~SoundFixtures()
{
    std::error_code ignored;
    std::filesystem::remove_all(directory_, ignored);
}

std::vector<int16_t> SoundFixtures::Pattern(int64_t frames, int32_t channels, int32_t seed)
{
    std::vector<int16_t> samples(size_t(frames * channels));
    uint32_t state = 0x9e3779b9u ^ uint32_t(seed);
    for (size_t i = 0; i < samples.size(); ++i) {
        // A linear congruential sequence: covers the whole range, repeats
        // exactly in every run.
        state = state * 1664525u + 1013904223u;
        samples[i] = int16_t(state >> 16);
    }
    return samples;
}

std::filesystem::path SoundFixtures::WriteRaw(const std::string& name, const std::vector<int16_t>& samples) const
{
    return WriteBytes(name, std::string(reinterpret_cast<const char*>(samples.data()), samples.size() * 2));
}

std::filesystem::path SoundFixtures::WriteBytes(const std::string& name, const std::string& bytes) const
{
    const std::filesystem::path path = PathOf(name);
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out.write(bytes.data(), std::streamsize(bytes.size()));
    return path;
}

std::filesystem::path SoundFixtures::Encode(const std::string& name, const std::vector<int16_t>& samples,
                                            int32_t rate, int32_t channels, const std::string& arguments) const
{
    const std::filesystem::path raw = WriteRaw(name + ".raw", samples);
    const std::filesystem::path out = PathOf(name);
    const std::string command = "ffmpeg -nostdin -v error -y -f s16le -ar " + std::to_string(rate) + " -ac "
        + std::to_string(channels) + " -i " + Quote(raw) + " " + arguments + " " + Quote(out);
    const bool ok = Run(command);
    std::filesystem::remove(raw);
    return ok ? out : std::filesystem::path();
}

bool SoundFixtures::Run(const std::string& command)
{
    return std::system((command + " >/dev/null 2>&1").c_str()) == 0;
}

std::vector<int16_t> SoundFixtures::DecodeWithFFmpeg(const std::filesystem::path& file) const
{
    const std::filesystem::path out = PathOf(file.filename().string() + ".decoded");
    if (!Run("ffmpeg -nostdin -v error -y -i " + Quote(file) + " -map 0:a:0 -f s16le " + Quote(out)))
        return {};
    std::ifstream in(out, std::ios::binary);
    const std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    std::vector<int16_t> samples(bytes.size() / 2);
    std::copy(bytes.data(), bytes.data() + samples.size() * 2, reinterpret_cast<char*>(samples.data()));
    return samples;
}

std::string SoundFixtures::Quote(const std::filesystem::path& path)
{
    std::string quoted = "'";
    for (char c : path.string()) {
        if (c == '\'')
            quoted += "'\\''";
        else
            quoted += c;
    }
    return quoted + "'";
}

}  // namespace glimmet::test
