#include "SoakActions.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "edit/TransformReference.h"

namespace glimmet::test {

using Kind = SoakRecord::Kind;

void SoakActions::Go(SoakModel& model, SoakRecord& r)
{
    switch (r.kind) {
    case Kind::Remove: return Remove(model, r);
    case Kind::Paste: return Paste(model, r);
    case Kind::Truncate: return Truncate(model, r);
    case Kind::RemoveChannel: return RemoveChannel(model, r);
    case Kind::Move:
    case Kind::AddChannel: return;
    case Kind::Maximize: return Maximize(model, r);
    case Kind::Filter: return Filter(model, r);
    case Kind::Stretch: return Stretch(model, r);
    default: return Transform(model, r);
    }
}

void SoakActions::Pass(SoakModel& model, const SoakRecord& r, int64_t history,
    const std::function<void(std::vector<int16_t>&)>& change, bool write, std::vector<int16_t>* kept)
{
    const int64_t n = r.end - r.start + 1;
    std::vector<int16_t> own(size_t(n + history), 0);
    std::vector<int16_t>& buffer = kept != nullptr ? *kept : own;
    for (SoakChannel& c : model.channels) {
        if (!c.state.selected)
            continue;
        SoakSamples filled;
        if (SoakChannelRules::Fill(c.state, filled, r.start - history, n + history))
            buffer = filled.ToVector();
        if (history == 0) {
            // The working buffer is the range itself, transformed in place.
            change(buffer);
            if (write)
                SoakModel::Replace(c, SoakSamples(buffer), r.start, r.end);
            continue;
        }
        // The filter keeps what it read and writes its output elsewhere.
        std::vector<int16_t> output = buffer;
        change(output);
        if (write)
            SoakModel::Replace(c, SoakSamples(output), r.start, r.end);
    }
}

void SoakActions::Transform(SoakModel& model, const SoakRecord& r)
{
    // Nothing can be written back before frame 0, so such a range changes
    // nothing whatever the transform computes.
    if (r.end - r.start + 1 < 1 || r.start < 0)
        return;
    using Ref = TransformReference;
    std::function<void(std::vector<int16_t>&)> change;
    switch (r.kind) {
    case Kind::FadeIn: change = [](auto& b) { b = Ref::FadeIn(b); }; break;
    case Kind::FadeOut: change = [](auto& b) { b = Ref::FadeOut(b); }; break;
    case Kind::Revert: change = [](auto& b) { b = Ref::Revert(b); }; break;
    case Kind::RevertPhases: change = [](auto& b) { b = Ref::RevertPhases(b); }; break;
    case Kind::Distort: change = [&r](auto& b) { b = SoakEffects::Distort(b, r.curve); }; break;
    case Kind::PeakDistort: change = [&r](auto& b) { b = SoakEffects::PeakDistort(b, r.curve); }; break;
    case Kind::Envelope: change = [&r](auto& b) { b = SoakEffects::Envelope(b, r.curve); }; break;
    default: return;
    }
    Pass(model, r, 0, change, true);
}

void SoakActions::Maximize(SoakModel& model, const SoakRecord& r)
{
    if (r.end - r.start + 1 < 1 || r.start < 0)
        return;
    using Ref = TransformReference;
    // Both passes share one working buffer: a channel that cannot be read
    // in the second pass gets what the last one of the first left.
    std::vector<int16_t> buffer(size_t(r.end - r.start + 1), 0);
    int peak = 0;
    Pass(model, r, 0, [&peak](auto& b) {
        for (int16_t v : b) {
            if (std::abs(int(v)) > std::abs(peak))
                peak = v;
        }
    }, false, &buffer);
    if (std::abs(peak) > 32766)
        return;
    const float factor = peak == 0 ? std::numeric_limits<float>::infinity() : std::fabs(32767.0f / float(peak));
    Pass(model, r, 0, [factor](auto& b) {
        for (int16_t& v : b)
            v = Ref::Low16(double(factor) * v);
    }, true, &buffer);
}

void SoakActions::Filter(SoakModel& model, const SoakRecord& r)
{
    // The kernel is drawn once, on the first run, from a dialog that can
    // always be read here; no taps filter nothing.
    const std::vector<double> kernel = SoakEffects::Kernel(r.curve, r.taps);
    if (kernel.empty() || r.end - r.start + 1 < 1 || r.start < 0)
        return;
    Pass(model, r, int64_t(kernel.size()), [&kernel](auto& b) { b = SoakEffects::Filter(b, kernel); }, true);
}

void SoakActions::Stretch(SoakModel& model, const SoakRecord& r)
{
    // The vocoder leaves a range this short silent: its stretch is silence
    // of the stretched length. A factor of 0 fails, writing nothing back.
    const int64_t n = r.end - r.start + 1;
    const int64_t count = SoakEffects::StretchedLength(n, r.stretch);
    if (n < 1 || r.stretch == 0.0f || count < 1 || n > SoakEffects::kSilentStretchFrames)
        return;
    for (SoakChannel& c : model.channels) {
        if (c.state.selected)
            SoakModel::Replace(c, SoakSamples::Zeros(count), r.start, r.end);
    }
}

void SoakActions::Remove(SoakModel& model, const SoakRecord& r)
{
    bool cut = false;
    for (SoakChannel& c : model.channels) {
        if (!c.state.selected)
            continue;
        SoakModel::Remove(c, r.start, r.end);
        c.state.selected = false;
        cut = true;
    }
    if (cut) {
        model.SetRangeStart(-1);
        model.SetRangeEnd(-1);
    }
}

void SoakActions::Paste(SoakModel& model, SoakRecord& r)
{
    r.firstChannel = -1;
    for (size_t i = 0; i < model.channels.size(); i++) {
        if (model.channels[i].state.selected) {
            r.firstChannel = int32_t(i);
            break;
        }
    }
    r.hadBuffer = !model.copyBuffer.empty();
    if (!r.hadBuffer)
        return;
    r.pasted = 0;
    const int64_t frames = model.copyBuffer[0].Size();
    const bool replace = r.firstChannel >= 0 && r.start >= 0 && r.start <= r.end;
    // Inserting goes into the channel focused now, which for a redo may not
    // be the one focused when the paste was first made; with none focused
    // it starts at the first channel.
    if (!replace)
        r.firstChannel = std::max(model.focus, 0);
    for (size_t i = 0; i < model.copyBuffer.size(); i++) {
        const size_t target = size_t(r.firstChannel) + i;
        if (target >= model.channels.size())
            break;
        if (replace) {
            SoakModel::Replace(model.channels[target], model.copyBuffer[i], r.start, r.end);
        } else {
            SoakModel::Insert(model.channels[target], model.copyBuffer[i], r.cursor);
            model.channels[target].state.selected = true;
        }
        r.pasted++;
    }
    r.pasteStart = replace ? r.start : r.cursor;
    r.pasteEnd = r.cursor + frames - 1;
    if (!replace)
        model.SetRangeStart(r.pasteStart);
    model.SetRangeEnd(r.pasteEnd);
}

void SoakActions::Truncate(SoakModel& model, const SoakRecord& r)
{
    for (SoakChannel& c : model.channels) {
        if (!c.state.selected)
            continue;
        SoakModel::Remove(c, r.end + 1, SoakChannelRules::End(c.state) - 1);
        SoakModel::Remove(c, 0, r.start - 1);
        c.state.selected = false;
    }
}

void SoakActions::RemoveChannel(SoakModel& model, SoakRecord& r)
{
    r.removedOne = false;
    if (r.focused < 0 || size_t(r.focused) >= model.channels.size())
        return;
    r.index = r.focused;
    r.held = model.channels[size_t(r.index)];
    model.channels.erase(model.channels.begin() + r.index);
    r.removedOne = true;
}

}  // namespace glimmet::test
