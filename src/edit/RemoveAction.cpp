#include "edit/RemoveAction.h"

#include <mutex>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

status_t RemoveAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    std::lock_guard guard(Manager()->DocumentLock());
    bool cut = false;
    for (int32_t i = 0; Channel* channel = Manager()->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->RemoveFrames(RangeStart(), RangeEnd());
        channel->SetSelected(false);
        cut = true;
    }
    if (cut) {
        Manager()->SetRangeStart(-1);
        Manager()->SetRangeEnd(-1);
    }
    return B_OK;
}

status_t RemoveAction::Undo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    std::lock_guard guard(Manager()->DocumentLock());
    RestoreSelection([this](Channel* channel, size_t record) {
        const SavedChannel& saved = SavedChannels()[record];
        if (saved.held)
            channel->InsertFrames(saved.data, RangeStart());
    });
    RestoreRange();
    return B_OK;
}

const char* RemoveAction::Name()
{
    return "Remove";
}

}  // namespace glimmet
