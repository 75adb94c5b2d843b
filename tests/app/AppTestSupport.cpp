#include "AppTestSupport.h"

#include <gtest/gtest.h>

#include <cstring>
#include <fstream>

#include "edit/Action.h"
#include "edit/HistoryManager.h"

namespace glimmet::test {

namespace {

/// An edit that changes nothing but counts as one in the history.
class MarkAction : public Action {
public:
    MarkAction() : Action(nullptr) {}
    status_t InitCheck() override { return B_OK; }
    status_t Go() override { return B_OK; }
    status_t Undo() override { return B_OK; }
    status_t Redo() override { return B_OK; }
    const char* Name() override { return "Mark"; }
};

void Put16(std::ofstream& out, uint16_t value)
{
    const char bytes[2] = {char(value & 0xff), char(value >> 8)};
    out.write(bytes, 2);
}

void Put32(std::ofstream& out, uint32_t value)
{
    Put16(out, uint16_t(value & 0xffff));
    Put16(out, uint16_t(value >> 16));
}

uint32_t Get32(const std::vector<char>& data, size_t at)
{
    uint32_t value = 0;
    for (int i = 3; i >= 0; --i)
        value = (value << 8) | uint8_t(data.at(at + size_t(i)));
    return value;
}

uint16_t Get16(const std::vector<char>& data, size_t at)
{
    return uint16_t(uint8_t(data.at(at)) | (uint8_t(data.at(at + 1)) << 8));
}

}  // namespace

void WriteWav(const std::filesystem::path& path, const std::vector<std::vector<int16_t>>& channels, uint32_t rate)
{
    const uint16_t count = uint16_t(channels.size());
    const uint32_t frames = channels.empty() ? 0 : uint32_t(channels[0].size());
    const uint32_t dataBytes = frames * count * 2;
    std::ofstream out(path, std::ios::binary);
    out.write("RIFF", 4);
    Put32(out, 36 + dataBytes);
    out.write("WAVEfmt ", 8);
    Put32(out, 16);
    Put16(out, 1);
    Put16(out, count);
    Put32(out, rate);
    Put32(out, rate * count * 2);
    Put16(out, uint16_t(count * 2));
    Put16(out, 16);
    out.write("data", 4);
    Put32(out, dataBytes);
    for (uint32_t frame = 0; frame < frames; ++frame) {
        for (const std::vector<int16_t>& channel : channels)
            Put16(out, uint16_t(channel[frame]));
    }
}

std::vector<std::vector<int16_t>> ReadWav(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    const std::vector<char> data((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    std::vector<std::vector<int16_t>> channels;
    if (data.size() < 12 || std::memcmp(data.data(), "RIFF", 4) != 0)
        return channels;
    uint16_t count = 0;
    for (size_t at = 12; at + 8 <= data.size();) {
        const uint32_t size = Get32(data, at + 4);
        if (std::memcmp(data.data() + at, "fmt ", 4) == 0) {
            count = Get16(data, at + 10);
            channels.assign(count, {});
        } else if (std::memcmp(data.data() + at, "data", 4) == 0 && count > 0) {
            const size_t end = std::min(data.size(), at + 8 + size);
            for (size_t sample = at + 8, index = 0; sample + 1 < end; sample += 2, ++index)
                channels[index % count].push_back(int16_t(Get16(data, sample)));
        }
        at += 8 + size + (size & 1);
    }
    return channels;
}

void MakeUnsaved(QuillexWindow* window)
{
    std::unique_ptr<Action> mark = std::make_unique<MarkAction>();
    ASSERT_EQ(window->History()->AddAction(mark), B_OK);
    ASSERT_FALSE(window->History()->IsSaved());
}

AppFixture::AppFixture()
{
    // Windows set up playback; tests never need a real sound device.
    if (qEnvironmentVariableIsEmpty("SDL_AUDIODRIVER"))
        qputenv("SDL_AUDIODRIVER", "dummy");
    application_ = std::make_unique<Quillex>();
    application_->SetQuitHook([this] { ++quits_; });
    QuillexWindow::SetSaveQuestion([](QuillexWindow*) {
        ADD_FAILURE() << "unexpected \"Save changes?\" question";
        return int(QuillexWindow::kDontQuit);
    });
}

AppFixture::~AppFixture()
{
    Drain();
    QuillexWindow::SetSaveQuestion(nullptr);
    application_.reset();
    Drain();
}

std::filesystem::path AppFixture::MakeSound(const std::string& name, int channels, int frames)
{
    std::vector<std::vector<int16_t>> samples(size_t(channels), std::vector<int16_t>(size_t(frames), 0));
    for (int c = 0; c < channels; ++c) {
        for (int f = 0; f < frames; ++f)
            samples[size_t(c)][size_t(f)] = int16_t((c + 1) * 100 + f);
    }
    const std::filesystem::path path = Dir() / name;
    WriteWav(path, samples);
    return path;
}

QuillexWindow* OpenWindow(AppFixture& fixture, const std::filesystem::path& file)
{
    QuillexWindow* window = fixture.App().NewWindow();
    if (!file.empty()) {
        window->LockWindow();
        window->SetTo(file);
        window->UnlockWindow();
    }
    Drain();
    return window;
}

bool IsListed(AppFixture& fixture, QuillexWindow* window)
{
    for (int32_t i = 0; i < fixture.App().CountWindows(); ++i) {
        if (fixture.App().WindowAt(i) == window)
            return true;
    }
    return false;
}

}  // namespace glimmet::test
