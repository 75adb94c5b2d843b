#include "app/StretchWorker.h"

#include "edit/StretchAction.h"
#include "support/MessageCodes.h"
#include "support/MessageTarget.h"

namespace glimmet {

std::atomic<int> StretchWorker::running_{0};

int StretchWorker::Running()
{
    return running_.load();
}

void StretchWorker::Release()
{
    action_ = nullptr;
    running_--;
}

StretchWorker::StretchWorker(MessageTarget& window) : window_(window) {}

StretchWorker::~StretchWorker()
{
    Stop();
}

void StretchWorker::Start(StretchAction* action)
{
    if (Busy() || action == nullptr)
        return;
    action_ = action;
    running_++;
    stop_ = false;
    thread_ = std::thread([this, action] {
        action->Compute(&stop_);
        window_.PostMessage(kMsgStretchFinished);
    });
}

double StretchWorker::Progress() const
{
    return Busy() ? action_->Progress() : 0.0;
}

bool StretchWorker::Finish()
{
    if (!Busy())
        return false;
    thread_.join();
    StretchAction* action = action_;
    action->WriteBack();
    Release();
    return true;
}

void StretchWorker::Stop()
{
    if (!Busy())
        return;
    stop_ = true;
    thread_.join();
    Release();
}

}  // namespace glimmet
