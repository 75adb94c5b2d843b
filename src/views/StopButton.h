#pragma once

#include "views/TransportButton.h"

namespace glimmet {

/// The stop button of the transport bar, 31 x 21. A click (press and
/// release inside) sends the template with "when" and "source".
/// GUI thread only.
class StopButton : public TransportButton {
    Q_OBJECT

public:
    /// target is not owned; the template is copied.
    StopButton(const char* name, const Message& message, MessageTarget* target, QWidget* parent = nullptr);

    QString PictureName() const override;

protected:
    void ReleasedInside() override;

private:
    Message message_;
};

}  // namespace glimmet
