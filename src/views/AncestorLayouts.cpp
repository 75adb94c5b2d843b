#include "views/AncestorLayouts.h"

#include <QLayout>
#include <QWidget>

namespace glimmet {

void AncestorLayouts::Activate(QWidget* widget)
{
    if (widget == nullptr)
        return;
    for (QWidget* ancestor = widget->parentWidget(); ancestor != nullptr; ancestor = ancestor->parentWidget()) {
        if (ancestor->layout() != nullptr)
            ancestor->layout()->activate();
        if (ancestor->isWindow())
            break;
    }
}

}  // namespace glimmet
