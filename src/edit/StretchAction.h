#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <vector>

#include "edit/Action.h"
#include "edit/StretchDialog.h"

namespace glimmet {

/// "Time Stretch": changes the duration of the range of the selected
/// channels with the phase vocoder. It cannot be taken back: Undo and Redo
/// fail, so the history drops it at the first undo while the samples stay
/// stretched.
///
/// Go() is three steps that may also be run apart, so that the long middle
/// one can run on a worker thread: ReadDialog (GUI thread), Compute (any
/// thread; touches only the action's own snapshot and buffers) and
/// WriteBack (GUI thread, under the document lock).
class StretchAction : public Action {
public:
    /// dialog is the open "Time Stretch" dialog, answering window; owned.
    StretchAction(MessageTarget* window, std::unique_ptr<StretchDialog> dialog);
    ~StretchAction() override;

    /// B_ERROR once the dialog has been consumed (so after Go()), else the
    /// base check.
    status_t InitCheck() override;
    status_t Go() override;
    status_t Undo() override;
    status_t Redo() override;
    const char* Name() override;
    bool SupportsConfiguration() override;

    /// Reads the parameters, closes the dialog and notes which channels are
    /// selected: those are the ones written back, whatever happens to the
    /// selection while the work runs elsewhere. B_NO_INIT, doing nothing,
    /// when there is no dialog or it cannot be read.
    status_t ReadDialog();
    /// Stretches every snapshot channel into its output buffer and prints
    /// one line per channel. stop, when set, ends the work early with a
    /// failure. Returns the status of the last channel.
    status_t Compute(const std::atomic<bool>* stop = nullptr);
    /// When the computed status is B_OK, replaces the range of each channel
    /// selected at ReadDialog with the output of the same index among all
    /// channels; frees the outputs. Returns the computed status.
    status_t WriteBack();

    const StretchParameters& Parameters() const { return parameters_; }
    /// How far Compute has come, 0 to 1; any thread may ask.
    double Progress() const;

    static bool Stretch(float* input, int64_t inputFrames, float* output, int64_t outputFrames, int32_t N,
        int32_t D, int32_t I, float P, float stretch, float unused);
    static void CopyFrame(float* dst, float* src, int32_t n);
    static void InterpolateFrame(float* dst, float* a, float* b, int32_t n, float t);
    static float MaxOf(float* a, int32_t n);

    /// trunc(frames * stretch), the product taken in float; 0 for a
    /// product that is not a usable length.
    static int64_t StretchedLength(int64_t frames, float stretch);
    /// trunc(x * 32767) kept to its low 16 bits; 0 for what is not a finite
    /// number of at most 63 bits.
    static int16_t ToSample(float x);

private:
    void NoteTargets();
    status_t StretchRecord(const SavedChannel& record, size_t index, const std::atomic<bool>* stop);
    void WriteChannel(Channel* channel, int32_t index);
    /// The first count frames of data as the vocoder's floats, into input,
    /// which holds zeros.
    static void ReadHead(const SampleSlice& data, float* input, int64_t count);

    std::unique_ptr<StretchDialog> dialog_;
    StretchParameters parameters_;
    /// One per snapshot record, the output's first window (the vocoder
    /// writes no further); an entry may be empty when its memory could
    /// not be had.
    std::vector<std::unique_ptr<float[]>> outputs_;
    status_t status_ = B_NO_INIT;
    /// The channels selected when the dialog was read, by index.
    std::vector<int32_t> targets_;
    /// The share done of the channel being stretched, and how many
    /// channels were done before it.
    std::atomic<double> channelProgress_{0.0};
    std::atomic<size_t> channelsDone_{0};
};

}  // namespace glimmet
