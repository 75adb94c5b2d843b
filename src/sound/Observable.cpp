#include "sound/Observable.h"

#include <string>

#include "support/Handler.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "support/MessageTarget.h"

namespace glimmet {

Observable::Observable()
{
    handles_.reserve(10);
}

Observable::~Observable() = default;

ObserverHandle* Observable::Subscribe(Observer* observer, uint32_t mask)
{
    if (observer == nullptr)
        return nullptr;
    return Append(ObserverHandle::ForObserver(observer, mask));
}

ObserverHandle* Observable::Subscribe(MessageTarget* target, uint32_t mask, const Message* templateMessage)
{
    return Append(ObserverHandle::ForTarget(target, mask, templateMessage));
}

ObserverHandle* Observable::Subscribe(Handler* handler, uint32_t mask, const Message* templateMessage)
{
    if (handler == nullptr)
        return nullptr;
    return Append(ObserverHandle::ForHandler(handler, mask, templateMessage));
}

ObserverHandle* Observable::Append(std::unique_ptr<ObserverHandle> handle)
{
    handles_.push_back(std::move(handle));
    return handles_.back().get();
}

void Observable::Unsubscribe(ObserverHandle* handle)
{
    if (handle == nullptr)
        return;
    for (size_t i = 0; i < handles_.size(); i++) {
        if (handles_[i].get() == handle) {
            RemoveAt(i);
            return;
        }
    }
}

void Observable::Unsubscribe(Observer* observer)
{
    if (observer == nullptr)
        return;
    for (size_t i = handles_.size(); i-- > 0;) {
        if (handles_[i] != nullptr && handles_[i]->ObserverOf() == observer)
            RemoveAt(i);
    }
}

void Observable::RemoveAt(size_t index)
{
    if (notifying_ > 0)
        handles_[index].reset();
    else
        handles_.erase(handles_.begin() + std::ptrdiff_t(index));
}

void Observable::DropEmptySlots()
{
    std::erase(handles_, nullptr);
}

int32_t Observable::CountSubscriptions() const
{
    int32_t count = 0;
    for (const auto& handle : handles_) {
        if (handle != nullptr)
            count++;
    }
    return count;
}

// The walk goes by index over the subscriptions that existed when it began,
// because a subscriber may change the list from inside its notification:
// removal only empties a slot while the walk lasts, and an addition lands
// past the end of the walk.
void Observable::Notify(uint32_t mask, const Message* data)
{
    notifying_++;
    const size_t count = handles_.size();
    for (size_t i = 0; i < count; i++) {
        const ObserverHandle* handle = handles_[i].get();
        if (handle == nullptr)
            continue;
        const uint32_t overlap = mask & handle->Mask();
        if (overlap != 0)
            NotifyOne(*handle, overlap, data);
    }
    if (--notifying_ == 0)
        DropEmptySlots();
}

// The handle may be deleted by the observer's own call, so nothing here
// touches it after that call.
void Observable::NotifyOne(const ObserverHandle& handle, uint32_t mask, const Message* data)
{
    if (Observer* observer = handle.ObserverOf()) {
        observer->ObserverNotified(this, mask, data);
        return;
    }
    if (Handler* handler = handle.HandlerOf()) {
        // A handler in no thread has nobody to deliver to.
        if (handler->thread() != nullptr)
            handler->PostMessage(NotificationFor(handle, mask, data));
        return;
    }
    // Delivery errors are of no concern to the notifier.
    if (MessageTarget* target = handle.TargetOf())
        target->PostMessage(NotificationFor(handle, mask, data));
}

Message Observable::NotificationFor(const ObserverHandle& handle, uint32_t mask, const Message* data)
{
    // A template replaces the 'obup' code with its own.
    Message message = handle.Template() != nullptr ? *handle.Template() : Message(kMsgObserverUpdate);
    if (data != nullptr)
        add_data_to_message(&message, data);
    message.AddInt32(kFieldMask, int32_t(mask));
    message.AddPointer(kFieldObservable, this);
    return message;
}

// Fields whose values differ in size need no special treatment here: a
// Message field takes values of any size of its type, so a copied field can
// always grow later with values of other sizes.
status_t add_data_to_message(Message* to, const Message* from)
{
    std::string name;
    Message::FieldType type{};
    int32_t count = 0;
    status_t status = B_OK;
    for (int32_t index = 0; (status = from->GetInfo(index, &name, &type, &count)) == B_OK; index++) {
        Message::FieldType present{};
        if (to->GetInfo(name, &present, nullptr) == B_OK && present == type)
            continue;
        for (int32_t item = 0; item < count; item++)
            to->CopyValue(*from, name, item);
    }
    return status;
}

}  // namespace glimmet
