#include "SoakDialogs.h"

#include "edit/CompressorAction.h"
#include "edit/CurveDialogFake.h"
#include "edit/DistortAction.h"
#include "edit/EnvelopeAction.h"
#include "edit/FilterAction.h"
#include "edit/StretchAction.h"
#include "edit/StretchDialogFake.h"

namespace glimmet::test {

using Kind = SoakRecord::Kind;

SoakCurve SoakDialogs::DrawCurve(uint64_t bits)
{
    // Inside the usual 0..1, past it on either side, and far past it.
    static const double kLevels[16] = {0.0, 0.25, 0.5, 0.75, 1.0, 0.1, 0.9, 1.0 / 3.0, -0.5, 1.5, 3.0, -2.0, 0.6, 0.05,
        40.0, -1000.0};
    SoakCurve curve;
    curve.y0 = kLevels[bits % 16];
    curve.y1 = kLevels[(bits >> 4) % 16];
    curve.readable = (bits >> 8) % 16 != 0;
    return curve;
}

SoakRecord SoakDialogs::Draw(Kind kind, const SoakStep& step)
{
    SoakRecord record;
    record.kind = kind;
    record.curve = DrawCurve(step.r[0] >> 8);
    if (kind == Kind::Filter) {
        static const int32_t kTaps[8] = {0, 1, 2, 3, 10, 10, 57, -3};
        record.taps = kTaps[(step.r[0] >> 20) % 8];
        record.curve.readable = true;
    }
    static const float kFactors[8] = {2.0f, 0.5f, 1.0f, 0.0f, 1.0f / 3.0f, 3.7f, -1.0f, 0.001f};
    record.stretch = kFactors[(step.r[0] >> 24) % 8];
    return record;
}

std::unique_ptr<Action> SoakDialogs::Make(SoakRecord& record)
{
    record.dialog = nullptr;
    if (record.kind == Kind::Stretch) {
        StretchParameters parameters = DefaultStretchParameters();
        parameters.stretch = record.stretch;
        return std::make_unique<StretchAction>(nullptr,
            std::make_unique<StretchDialogFake>(std::make_shared<StretchDialogLog>(), parameters));
    }
    auto fake = std::make_unique<CurveDialogFake>(std::make_shared<CurveDialogLog>(), std::vector<double>{0.0, 1.0},
        std::vector<double>{record.curve.y0, record.curve.y1}, record.taps);
    fake->SetReadable(record.curve.readable);
    CurveDialogFake* kept = fake.get();
    switch (record.kind) {
    case Kind::Filter: return std::make_unique<FilterAction>(nullptr, std::move(fake));
    case Kind::Distort: record.dialog = kept; return std::make_unique<DistortAction>(nullptr, std::move(fake));
    case Kind::PeakDistort: record.dialog = kept; return std::make_unique<CompressorAction>(nullptr, std::move(fake));
    case Kind::Envelope: record.dialog = kept; return std::make_unique<EnvelopeAction>(nullptr, std::move(fake));
    default: return nullptr;
    }
}

void SoakDialogs::Redraw(SoakRecord& record, const SoakCurve& curve)
{
    if (record.dialog == nullptr)
        return;
    auto* fake = static_cast<CurveDialogFake*>(record.dialog);
    fake->SetKnots({0.0, 1.0}, {curve.y0, curve.y1});
    fake->SetReadable(curve.readable);
    record.curve = curve;
}

}  // namespace glimmet::test
