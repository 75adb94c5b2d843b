#include "SoakFiles.h"

#include <unistd.h>

#include <atomic>
#include <cmath>
#include <string>

#include "files/DocumentLoader.h"
#include "files/DocumentSaver.h"
#include "sound/Channel.h"

namespace glimmet::test {

namespace {

/// One side of a frame: the sum of its contributors and how many there were.
struct Side {
    float sum = 0.0f;
    int count = 0;

    void Add(float value)
    {
        sum += value;
        count++;
    }

    int16_t Sample() const
    {
        // One channel alone is never bent; the output scale is 32767
        // although the input one is 32768.
        if (count == 0)
            return 0;
        const float value = count == 1 ? sum : SoakFiles::SoftClip(sum);
        // Rounded to nearest; what leaves the 16-bit range (the curve falls
        // below -1 for sums far past it) or is not a number stores -32768,
        // as a 16-bit integer store of the FPU does.
        const double rounded = std::nearbyint(double(value * 32767.0f));
        if (!(rounded >= -32768.0 && rounded <= 32767.0))
            return -32768;
        return int16_t(rounded);
    }
};

}  // namespace

float SoakFiles::SoftClip(float x)
{
    const float knee = 0.3f;
    const float reach = 0.7f;
    const float width = 1.2f;
    if (x < -knee)
        return -SoftClip(-x);
    if (x <= knee)
        return x;
    // A parabola peaking at 1.5, blended in from the knee up to 1.
    const double toPeak = std::pow(double((x - knee) / width - 1.0f), 2.0);
    const float parabola = float(double(knee) + double(reach) * (1.0 - toPeak));
    if (!(x < 1.0f))
        return parabola;
    const double a = std::pow(double((x - knee) / reach - 1.0f), 2.0);
    const float keep = float(1.0 - a);
    return float(double(parabola * keep) + double(x) * a);
}

std::vector<std::vector<int16_t>> SoakFiles::SaveMix(const std::vector<SoakChannel>& channels)
{
    int64_t total = 0;
    for (const SoakChannel& c : channels)
        total = std::max(total, SoakChannelRules::End(c.state));
    std::vector<std::vector<int16_t>> mix(2, std::vector<int16_t>(size_t(total), 0));
    // The save asks for the mix a buffer at a time, and the mixer reads
    // every channel's part of it as one request, with the quirks of such a
    // read: a part that cannot be read (it starts exactly at the channel's
    // end) is silence, and so is one that ends exactly at its first frame.
    std::vector<std::vector<int16_t>> parts(channels.size());
    SoakSamples part;
    for (int64_t t0 = 0; t0 < total; t0 += kFramesPerBuffer) {
        const int64_t n = std::min(kFramesPerBuffer, total - t0);
        for (size_t k = 0; k < channels.size(); k++) {
            if (SoakChannelRules::Fill(channels[k].state, part, t0, n))
                parts[k] = part.ToVector();
            else
                parts[k].assign(size_t(n), 0);
        }
        for (int64_t i = 0; i < n; i++) {
            Side left;
            Side right;
            for (size_t k = 0; k < channels.size(); k++) {
                const SoakChannelState& c = channels[k].state;
                if (c.muted)
                    continue;
                const float value = float(parts[k][size_t(i)]) * 3.0517578125e-05f;
                if (c.pan != Channel::kPanRight)
                    left.Add(value);
                if (c.pan != Channel::kPanLeft)
                    right.Add(value);
            }
            mix[0][size_t(t0 + i)] = left.Sample();
            mix[1][size_t(t0 + i)] = right.Sample();
        }
    }
    return mix;
}

std::vector<SoakChannel> SoakFiles::Opened(const std::vector<std::vector<int16_t>>& mix)
{
    std::vector<SoakChannel> opened(2);
    for (size_t k = 0; k < 2; k++) {
        opened[k].state.samples = SoakSamples(mix[k]);
        opened[k].state.first = 0;
        opened[k].state.pan = k == 0 ? Channel::kPanLeft : Channel::kPanRight;
    }
    return opened;
}

std::filesystem::path SoakFiles::TemporaryPath(const char* tag)
{
    static std::atomic<uint64_t> serial{0};
    const std::string name = std::string("glimmet-soak-") + std::to_string(::getpid()) + "-" + std::to_string(serial++)
        + "-" + tag;
    return std::filesystem::temp_directory_path() / name;
}

std::string SoakFiles::SaveAndReopen(TestDocument& document, HistoryManager& history, SoakModel& model,
    std::string& mismatch)
{
    if (model.Total() == 0)
        return "Save skipped: nothing to save";
    // Undoing a Truncate of a range far before frame 0 can leave billions
    // of silent frames, which would be gigabytes of file and of mix.
    if (model.Total() > kLongestSave)
        return "Save skipped: " + std::to_string(model.Total()) + " frames";
    const std::filesystem::path path = TemporaryPath("saved.wav");
    bool written = false;
    DocumentSaver::SaveFile(path, &document.manager, &history, &written);
    if (!written || !history.IsSaved())
        mismatch = written ? "saved, but the history is not marked saved" : "the save did not write the file";
    // Opening replaces the channels with the file's and starts a history
    // of its own, as a window opening the file would.
    const status_t loaded = DocumentLoader::Load(path, &document.manager, false);
    std::error_code ignored;
    std::filesystem::remove(path, ignored);
    if (loaded != B_OK && mismatch.empty())
        mismatch = "the saved file did not open again: " + std::to_string(loaded);
    history.Clear();
    model.undo.clear();
    model.redo.clear();
    model.channels = Opened(SaveMix(model.channels));
    for (size_t k = 0; k < model.channels.size() && int32_t(k) < document.manager.CountChannels(); k++)
        model.channels[k].id = document.manager.ChannelAt(int32_t(k))->Id();
    document.SetRange(0, 10);
    model.SetRangeStart(0);
    model.SetRangeEnd(10);
    return "Save and open again: " + std::to_string(model.Total()) + " frames";
}

std::string SoakFiles::FailedSave(TestDocument& document, HistoryManager& history, std::string& mismatch)
{
    const std::filesystem::path path = TemporaryPath("missing-folder") / "saved.wav";
    const bool saved = history.IsSaved();
    bool written = false;
    const status_t status = DocumentSaver::SaveFile(path, &document.manager, &history, &written);
    std::error_code ignored;
    if (status == B_OK || written || std::filesystem::exists(path, ignored))
        mismatch = "a save into a folder that does not exist succeeded";
    else if (history.IsSaved() != saved)
        mismatch = "a failed save changed whether the history is saved";
    return std::string("Save into a missing folder (history ") + (saved ? "saved" : "unsaved") + ")";
}

}  // namespace glimmet::test
