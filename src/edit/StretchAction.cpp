#include "edit/StretchAction.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <mutex>
#include <new>
#include <vector>

#include "edit/vocoder/VocoderState.h"
#include "edit/vocoder/VocoderStretch.h"
#include "sound/BlockBuilder.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"

namespace glimmet {

namespace {

// The longest output a channel could take back (its sample count is kept
// in 32 bits); anything longer cannot be written back, so it is not made.
constexpr int64_t kLongestOutput = (int64_t(1) << 32) - 1;

// Beyond this magnitude a float is a multiple of 2^16, whose low 16 bits are
// 0; below it the value fits an int64 exactly.
constexpr float kLowBitsVanish = 549755813888.0f;  // 2^39

}  // namespace

StretchAction::StretchAction(MessageTarget* window, std::unique_ptr<StretchDialog> dialog)
    : Action(window), dialog_(std::move(dialog))
{
}

StretchAction::~StretchAction()
{
    if (dialog_)
        dialog_->Quit();
}

status_t StretchAction::InitCheck()
{
    if (!dialog_)
        return B_ERROR;
    return Action::InitCheck();
}

status_t StretchAction::Go()
{
    const status_t read = ReadDialog();
    if (read != B_OK)
        return read;
    Compute();
    return WriteBack();
}

status_t StretchAction::ReadDialog()
{
    if (!dialog_ || !dialog_->Lock())
        return B_NO_INIT;
    parameters_ = dialog_->GetParameters();
    dialog_->Unlock();
    dialog_->Quit();
    dialog_.reset();
    NoteTargets();
    return B_OK;
}

void StretchAction::NoteTargets()
{
    targets_.clear();
    if (Manager() == nullptr)
        return;
    std::lock_guard guard(Manager()->DocumentLock());
    for (int32_t c = 0; Channel* channel = Manager()->ChannelAt(c); c++) {
        if (channel->IsSelected())
            targets_.push_back(c);
    }
}

status_t StretchAction::Compute(const std::atomic<bool>* stop)
{
    std::lock_guard vocoder(VocoderState::Shared().Lock());
    status_ = B_NO_INIT;
    outputs_.clear();
    outputs_.resize(SavedChannels().size());
    for (size_t r = 0; r < SavedChannels().size(); r++) {
        channelsDone_ = r;
        channelProgress_ = 0.0;
        status_ = StretchRecord(SavedChannels()[r], r, stop);
        if (status_ == B_OK)
            Diagnostics::Print("stretch on buffer[%ld] done!\n", long(r));
        else
            Diagnostics::Print("Error during time stretch!\n");
    }
    channelsDone_ = SavedChannels().size();
    channelProgress_ = 0.0;
    return status_;
}

double StretchAction::Progress() const
{
    const size_t count = SavedChannels().size();
    if (count == 0)
        return 0.0;
    const double within = std::clamp(channelProgress_.load(), 0.0, 1.0);
    return std::min(1.0, (double(channelsDone_.load()) + within) / double(count));
}

status_t StretchAction::StretchRecord(const SavedChannel& record, size_t index, const std::atomic<bool>* stop)
{
    const int64_t frames = FrameCount();
    const int64_t outputFrames = StretchedLength(frames, parameters_.stretch) + 1;
    if (frames < 1 || outputFrames > kLongestOutput)
        return B_NO_MEMORY;
    // The vocoder reads only the first windows of the input and writes only
    // the first window of the output, so only those are held, whatever the
    // range's length; the rest of the output is silence.
    const int64_t inputHead = std::min(frames, VocoderStretch::kInputRead);
    const int64_t outputHead = std::min(outputFrames, VocoderStretch::kOutputWritten);
    std::unique_ptr<float[]> input(new (std::nothrow) float[size_t(inputHead)]());
    std::unique_ptr<float[]> output(new (std::nothrow) float[size_t(outputHead)]());
    if (!input || !output)
        return B_NO_MEMORY;
    if (record.held && record.data.Count() == frames)
        ReadHead(record.data, input.get(), inputHead);
    const StretchParameters& p = parameters_;
    const bool ok = VocoderStretch::Stretch(input.get(), frames, output.get(), outputFrames, p.fftLength,
        p.windowSize, p.interpolation, float(p.decimation), p.stretch, p.pitch, stop, &channelProgress_);
    outputs_[index] = std::move(output);
    return ok ? B_OK : B_ERROR;
}

void StretchAction::ReadHead(const SampleSlice& data, float* input, int64_t count)
{
    // input starts as zeros: the leading silence stays as it is.
    const int64_t leading = std::min(data.leading, count);
    const int64_t stored = std::min(data.blocks.Count(), count - leading);
    if (stored <= 0)
        return;
    int64_t i = leading;
    data.blocks.ForEachSpan(0, stored, [&](const SampleSpan& span) {
        for (int64_t k = 0; k < span.count; k++)
            input[size_t(i++)] = float(span.samples[k]) * (1.0f / 32768.0f);
    });
}

status_t StretchAction::WriteBack()
{
    if (status_ == B_OK) {
        std::lock_guard guard(Manager()->DocumentLock());
        for (int32_t c : targets_) {
            if (Channel* channel = Manager()->ChannelAt(c))
                WriteChannel(channel, c);
        }
    }
    outputs_.clear();
    return status_;
}

void StretchAction::WriteChannel(Channel* channel, int32_t index)
{
    const int64_t count = StretchedLength(FrameCount(), parameters_.stretch);
    if (count < 1 || count > kLongestOutput)
        return;
    // The outputs are indexed by the channel's place among all channels, not
    // among the selected ones: a channel past the outputs, or one whose
    // output could not be made, gets silence. Past the vocoder's window the
    // output is silence too, and is stored as shared silence: a stretch to a
    // billion frames costs references.
    const size_t slot = size_t(index);
    const float* output = slot < outputs_.size() ? outputs_[slot].get() : nullptr;
    const int64_t head = output != nullptr ? std::min(count, VocoderStretch::kOutputWritten) : 0;
    std::vector<int16_t> samples(static_cast<size_t>(head));
    for (int64_t i = 0; i < head; i++)
        samples[size_t(i)] = ToSample(output[size_t(i)]);
    BlockBuilder builder;
    builder.AppendSamples(samples.data(), head);
    builder.AppendZeros(count - head);
    if (!builder.Ok())
        return;
    SampleSlice result;
    result.blocks = builder.Finish();
    channel->ReplaceFrames(result, RangeStart(), RangeEnd());
    if (slot < outputs_.size())
        outputs_[slot].reset();
}

int64_t StretchAction::StretchedLength(int64_t frames, float stretch)
{
    const float product = float(frames) * stretch;
    if (!(product >= 0.0f && product < 9.2e18f))
        return 0;
    return int64_t(product);
}

int16_t StretchAction::ToSample(float x)
{
    const float scaled = x * 32767.0f;
    if (!(std::fabs(scaled) < kLowBitsVanish))
        return 0;
    return int16_t(uint16_t(uint64_t(int64_t(scaled)) & 0xFFFFu));
}

status_t StretchAction::Undo()
{
    return B_ERROR;
}

status_t StretchAction::Redo()
{
    return B_ERROR;
}

const char* StretchAction::Name()
{
    return "Time Stretch";
}

bool StretchAction::SupportsConfiguration()
{
    return true;
}

bool StretchAction::Stretch(float* input, int64_t inputFrames, float* output, int64_t outputFrames, int32_t N,
    int32_t D, int32_t I, float P, float stretch, float unused)
{
    return VocoderStretch::Stretch(input, inputFrames, output, outputFrames, N, D, I, P, stretch, unused);
}

void StretchAction::CopyFrame(float* dst, float* src, int32_t n)
{
    VocoderStretch::CopyFrame(dst, src, n);
}

void StretchAction::InterpolateFrame(float* dst, float* a, float* b, int32_t n, float t)
{
    VocoderStretch::InterpolateFrame(dst, a, b, n, t);
}

float StretchAction::MaxOf(float* a, int32_t n)
{
    return VocoderStretch::MaxOf(a, n);
}

}  // namespace glimmet
