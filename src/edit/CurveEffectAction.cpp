#include "edit/CurveEffectAction.h"

#include <optional>

namespace glimmet {

CurveEffectAction::CurveEffectAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog)
    : Action(window), dialog_(std::move(dialog))
{
}

CurveEffectAction::~CurveEffectAction()
{
    CloseDialog();
}

bool CurveEffectAction::SupportsConfiguration()
{
    return true;
}

void CurveEffectAction::CloseDialog()
{
    if (!dialog_)
        return;
    dialog_->Quit();
    dialog_.reset();
}

status_t CurveEffectAction::ShapeSelectedRanges(const Shape& shape)
{
    if (InitCheck() != B_OK || !dialog_)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*dialog_);
    const effects::SplineCurve* readable = curve ? &*curve : nullptr;
    return TransformSelectedRanges([&shape, readable](int16_t* samples, int64_t count) {
        shape(std::span<int16_t>(samples, size_t(count)), readable);
    });
}

}  // namespace glimmet
