#pragma once

#include <memory>
#include <vector>

#include "edit/CurveDialog.h"
#include "edit/effects/Spline.h"

namespace glimmet::test {

/// What a test can see of a fake dialog after its action let go of it.
struct CurveDialogLog {
    int locks = 0;
    int failedLocks = 0;
    int hides = 0;
    int quits = 0;
    bool hidden = false;
    bool destroyed = false;
};

/// A parameter dialog without a window: a curve through given knots, a tap
/// count, and a switch that makes it unreadable.
class CurveDialogFake : public CurveDialog {
public:
    CurveDialogFake(std::shared_ptr<CurveDialogLog> log, const std::vector<double>& x, const std::vector<double>& y,
        int32_t passes = 0)
        : log_(std::move(log)), passes_(passes)
    {
        SetKnots(x, y);
    }
    ~CurveDialogFake() override { log_->destroyed = true; }

    void SetKnots(const std::vector<double>& x, const std::vector<double>& y)
    {
        spline_.Set(x.data(), y.data(), int32_t(x.size()));
    }
    void SetPasses(int32_t passes) { passes_ = passes; }
    void SetReadable(bool readable) { readable_ = readable; }

    bool Lock() override
    {
        if (!readable_ || quit_) {
            log_->failedLocks++;
            return false;
        }
        log_->locks++;
        return true;
    }
    void Unlock() override {}
    effects::SplineCurve Curve() override { return effects::SplineCurve(spline_); }
    int32_t NumPasses() override { return passes_; }
    bool IsHidden() override { return log_->hidden; }
    void Hide() override
    {
        log_->hides++;
        log_->hidden = true;
    }
    void Quit() override
    {
        log_->quits++;
        quit_ = true;
    }

private:
    std::shared_ptr<CurveDialogLog> log_;
    Spline spline_;
    int32_t passes_;
    bool readable_ = true;
    bool quit_ = false;
};

}  // namespace glimmet::test
