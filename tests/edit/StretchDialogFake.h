#pragma once

#include <memory>

#include "edit/StretchDialog.h"

namespace glimmet::test {

/// What a StretchDialogFake was asked to do; outlives the fake.
struct StretchDialogLog {
    int reads = 0;
    bool quit = false;
    bool destroyed = false;
};

/// A time stretch dialog with fixed values, for testing the action without
/// widgets.
class StretchDialogFake : public StretchDialog {
public:
    StretchDialogFake(std::shared_ptr<StretchDialogLog> log, const StretchParameters& values, bool lockable = true)
        : log_(std::move(log)), values_(values), lockable_(lockable)
    {
    }
    ~StretchDialogFake() override { log_->destroyed = true; }

    bool Lock() override { return lockable_; }
    void Unlock() override {}
    StretchParameters GetParameters() override
    {
        log_->reads++;
        return values_;
    }
    void Quit() override { log_->quit = true; }

private:
    std::shared_ptr<StretchDialogLog> log_;
    StretchParameters values_;
    bool lockable_;
};

/// The dialog's values as it opens.
inline StretchParameters DefaultStretchParameters()
{
    return StretchParameters{8192, 8192, 2048, 2048, 2.0f, 0.0f, 0.0f};
}

}  // namespace glimmet::test
