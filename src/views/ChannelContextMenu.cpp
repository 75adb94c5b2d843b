#include "views/ChannelContextMenu.h"

#include <QActionGroup>
#include <QMenu>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentWindow.h"
#include "support/MessageCodes.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

namespace glimmet {

ChannelContextMenu::ChannelContextMenu(ChannelContainerView& container) : container_(container) {}

Channel* ChannelContextMenu::ChannelAt(int32_t index) const
{
    ChannelManager* manager = container_.Manager();
    return manager != nullptr ? manager->ChannelAt(index) : nullptr;
}

void ChannelContextMenu::Show(SampleView* view, QPointF point)
{
    const int32_t index = container_.IndexOf(view);
    Channel* channel = ChannelAt(index);
    if (channel == nullptr)
        return;
    contextChannel_ = index;
    QMenu* menu = MenuFor(channel);
    openMenu_ = menu;
    menu->popup(view->mapToGlobal(point.toPoint()));
}

QMenu* ChannelContextMenu::MenuForChannel(int32_t index)
{
    Channel* channel = ChannelAt(index);
    if (channel == nullptr)
        return nullptr;
    contextChannel_ = index;
    return MenuFor(channel);
}

QMenu* ChannelContextMenu::OpenMenu() const
{
    return openMenu_.data();
}

// The items post to the container, which hands each command back to
// Apply() when it arrives.
QMenu* ChannelContextMenu::MenuFor(Channel* channel)
{
    ChannelContainerView* container = &container_;
    auto* menu = new QMenu(container);
    menu->setObjectName("channel menu");
    menu->setAttribute(Qt::WA_DeleteOnClose);
    const auto addItem = [container, menu](const char* label, uint32_t what, bool marked) {
        QAction* action = menu->addAction(QString::fromUtf8(label));
        action->setCheckable(true);
        action->setChecked(marked);
        QObject::connect(action, &QAction::triggered, container, [container, what] { container->PostMessage(what); });
        return action;
    };
    addItem("Mute", kMsgToggleMute, channel->IsMuted());
    menu->addSeparator();
    // The pan positions are one choice: at most one of them is marked.
    auto* pan = new QActionGroup(menu);
    pan->setExclusionPolicy(QActionGroup::ExclusionPolicy::Exclusive);
    pan->addAction(addItem("Left", kMsgPanLeft, channel->PanPosition() == Channel::kPanLeft));
    pan->addAction(addItem("Middle", kMsgPanMiddle, channel->PanPosition() == Channel::kPanMiddle));
    pan->addAction(addItem("Right", kMsgPanRight, channel->PanPosition() == Channel::kPanRight));
    menu->addSeparator();
    // "Remove" goes to the window, which removes the channel as an action.
    QAction* remove = menu->addAction(QStringLiteral("Remove"));
    QObject::connect(remove, &QAction::triggered, container, [container] {
        if (container->Window() != nullptr)
            container->Window()->PostMessage(kMsgRemoveChannel);
    });
    return menu;
}

bool ChannelContextMenu::Apply(uint32_t what)
{
    Channel* channel = ChannelAt(contextChannel_);
    if (channel == nullptr)
        return false;
    switch (what) {
    case kMsgToggleMute:
        channel->SetMuted(!channel->IsMuted());
        return true;
    case kMsgPanLeft:
        channel->SetPanPosition(Channel::kPanLeft);
        return true;
    case kMsgPanMiddle:
        channel->SetPanPosition(Channel::kPanMiddle);
        return true;
    case kMsgPanRight:
        channel->SetPanPosition(Channel::kPanRight);
        return true;
    default:
        return false;
    }
}

}  // namespace glimmet
