#include "app/MenuBuilder.h"

#include <QAction>
#include <QMenuBar>

#include <utility>

namespace glimmet {

namespace {

QKeySequence ShortcutOf(const MenuEntry& entry)
{
    const Qt::KeyboardModifiers modifiers =
        entry.shift ? (Qt::ControlModifier | Qt::ShiftModifier) : Qt::ControlModifier;
    return QKeySequence(QKeyCombination(modifiers, Qt::Key(entry.key)));
}

}  // namespace

MenuBuilder::MenuBuilder(Post toWindow, Post toApplication)
    : toWindow_(std::move(toWindow)), toApplication_(std::move(toApplication))
{
}

QMenuBar* MenuBuilder::Build(QWidget* parent)
{
    auto* bar = new QMenuBar(parent);
    QMenu* menu = nullptr;
    for (const MenuEntry& entry : DocumentMenuTable()) {
        const QString title = QString::fromUtf8(entry.menu);
        if (menu == nullptr || menu->title() != title)
            menu = bar->addMenu(title);
        if (entry.label == nullptr) {
            menu->addSeparator();
            continue;
        }
        QAction* item = menu->addAction(QString::fromUtf8(entry.label));
        if (entry.key != 0)
            GiveShortcut(item, ShortcutOf(entry));
        const Message message(entry.code);
        const Post& post = entry.toApplication ? toApplication_ : toWindow_;
        QObject::connect(item, &QAction::triggered, item, [post, message] { post(message); });
        Keep(entry.kept, item);
    }
    return bar;
}

// Two items may share a shortcut. Qt would refuse both as ambiguous; the
// first item in the menu bar's order is the one the keys fire. The later one
// still shows the keys in its menu, but they act on it only where its own
// menu has the keyboard, which the first item's window context never does.
void MenuBuilder::GiveShortcut(QAction* item, const QKeySequence& keys)
{
    item->setShortcut(keys);
    if (!taken_.contains(keys)) {
        taken_.insert(keys);
        return;
    }
    item->setShortcutContext(Qt::WidgetShortcut);
}

void MenuBuilder::Keep(KeptMenuItem which, QAction* item)
{
    if (which == KeptMenuItem::None)
        return;
    kept_[size_t(which)] = item;
    if (which == KeptMenuItem::BubbleHelp) {
        // Only the application's broadcast marks the item; a click must
        // not toggle the mark by itself.
        item->setCheckable(true);
        QObject::connect(item, &QAction::triggered, item, [item](bool checked) { item->setChecked(!checked); });
    }
}

QAction* MenuBuilder::Item(KeptMenuItem which) const
{
    if (which == KeptMenuItem::None)
        return nullptr;
    return kept_[size_t(which)];
}

}  // namespace glimmet
