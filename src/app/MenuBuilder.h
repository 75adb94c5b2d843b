#pragma once

#include <QKeySequence>
#include <QSet>

#include <array>
#include <functional>

#include "app/MenuTable.h"
#include "support/Message.h"

class QAction;
class QMenuBar;
class QWidget;

namespace glimmet {

/// Builds a document window's menu bar from DocumentMenuTable: the items in
/// their menus, their shortcuts, where each posts its command, and the
/// handles on the items the window changes later.
///
/// GUI thread only.
class MenuBuilder {
public:
    using Post = std::function<void(const Message& message)>;

    /// toWindow and toApplication deliver an item's command to the window or
    /// to the application object, as the item's row says.
    MenuBuilder(Post toWindow, Post toApplication);

    /// The menu bar, owned by parent.
    QMenuBar* Build(QWidget* parent);

    /// The item kept as which; null for None and before Build.
    QAction* Item(KeptMenuItem which) const;

private:
    void Keep(KeptMenuItem which, QAction* item);
    void GiveShortcut(QAction* item, const QKeySequence& keys);

    Post toWindow_;
    Post toApplication_;
    /// Indexed by KeptMenuItem; owned by their menus.
    std::array<QAction*, size_t(KeptMenuItem::BubbleHelp) + 1> kept_{};
    QSet<QKeySequence> taken_;  // shortcuts already given to an item
};

}  // namespace glimmet
