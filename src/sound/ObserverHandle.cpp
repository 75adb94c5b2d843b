#include "sound/ObserverHandle.h"

namespace glimmet {

ObserverHandle::ObserverHandle(uint32_t mask, const Message* templateMessage)
    : mask_(mask), template_(templateMessage != nullptr ? std::make_unique<Message>(*templateMessage) : nullptr)
{
}

std::unique_ptr<ObserverHandle> ObserverHandle::ForObserver(Observer* observer, uint32_t mask)
{
    std::unique_ptr<ObserverHandle> handle(new ObserverHandle(mask, nullptr));
    handle->observer_ = observer;
    return handle;
}

std::unique_ptr<ObserverHandle> ObserverHandle::ForHandler(Handler* handler, uint32_t mask,
                                                           const Message* templateMessage)
{
    std::unique_ptr<ObserverHandle> handle(new ObserverHandle(mask, templateMessage));
    handle->handler_ = handler;
    return handle;
}

std::unique_ptr<ObserverHandle> ObserverHandle::ForTarget(MessageTarget* target, uint32_t mask,
                                                          const Message* templateMessage)
{
    std::unique_ptr<ObserverHandle> handle(new ObserverHandle(mask, templateMessage));
    handle->target_ = target;
    return handle;
}

}  // namespace glimmet
