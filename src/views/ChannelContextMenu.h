#pragma once

#include <cstdint>

#include <QPointF>
#include <QPointer>

class QMenu;

namespace glimmet {

class Channel;
class ChannelContainerView;
class SampleView;

/// The menu a secondary click opens on a channel: Mute, the three pan
/// positions and Remove. Its items post 'much', 'stcl', 'stcm' and 'stcr' to
/// the container, which hands them back to Apply() for the channel the menu
/// was opened on; Remove goes to the window as 'remc'.
///
/// GUI thread only. The menus are children of the container and delete
/// themselves when closed.
class ChannelContextMenu {
public:
    explicit ChannelContextMenu(ChannelContainerView& container);

    /// Opens the menu of view's channel at point (view coordinates).
    void Show(SampleView* view, QPointF point);
    /// A new menu for channel, not shown.
    QMenu* MenuFor(Channel* channel);
    /// The menu of channel index as a secondary click would build it, not
    /// shown; null when there is no such channel.
    QMenu* MenuForChannel(int32_t index);
    /// The channel the last menu was built for, -1 before any.
    int32_t ContextChannel() const { return contextChannel_; }
    /// The menu opened by the last secondary click, while it exists.
    QMenu* OpenMenu() const;
    /// Carries out a menu command on the context channel; false when what
    /// is none of them or there is no such channel any more.
    bool Apply(uint32_t what);

private:
    Channel* ChannelAt(int32_t index) const;

    ChannelContainerView& container_;
    int32_t contextChannel_ = -1;
    QPointer<QMenu> openMenu_;  // deletes itself when closed
};

}  // namespace glimmet
