#include "app/ControlRow.h"

#include <QCheckBox>
#include <QComboBox>
#include <QHBoxLayout>
#include <QLabel>

#include "app/TextControl.h"
#include "support/MessageCodes.h"
#include "support/MessageTarget.h"
#include "views/PlayButton.h"
#include "views/PlayModeButton.h"
#include "views/StopButton.h"

namespace glimmet {

namespace {

constexpr int kTransportGap = 5;
constexpr int kRangeFieldGap = 15;

}  // namespace

ControlRow::ControlRow(MessageTarget* window, QWidget* parent) : QWidget(parent), window_(window)
{
    auto* layout = new QHBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);

    AddTransportButtons(layout);
    layout->addWidget(CreatePlayModePopup());
    loopBox_ = new QCheckBox(QStringLiteral("Loop"), this);
    loopBox_->setChecked(true);
    connect(loopBox_, &QCheckBox::clicked, this, [this] { window_->PostMessage(kMsgLoop); });
    layout->addWidget(loopBox_);
    layout->addStretch(1);
    AddRangeFields(layout);
}

// The play mode button starts in mode 1, the stopped one.
void ControlRow::AddTransportButtons(QHBoxLayout* layout)
{
    play_ = new PlayButton("play", Message(kMsgPlay), Message(kMsgPlayFromCursor), window_, PlayButton::kForward,
        this);
    playMode_ = new PlayModeButton("play mode", Message(kMsgTogglePlay), window_, PlayModeButton::kPaused, this);
    stop_ = new StopButton("stop", Message(kMsgStop), window_, this);
    for (QWidget* button : {static_cast<QWidget*>(play_), static_cast<QWidget*>(playMode_),
             static_cast<QWidget*>(stop_)}) {
        layout->addWidget(button);
        layout->addSpacing(kTransportGap);
    }
}

QWidget* ControlRow::CreatePlayModePopup()
{
    auto* popup = new QWidget(this);
    auto* layout = new QHBoxLayout(popup);
    layout->setContentsMargins(0, 0, 0, 0);
    auto* label = new QLabel(QStringLiteral("Play"), popup);
    playModePopup_ = new QComboBox(popup);
    playModePopup_->addItems({QStringLiteral("All"), QStringLiteral("Range"), QStringLiteral("Visible")});
    label->setBuddy(playModePopup_);
    connect(playModePopup_, &QComboBox::activated, this, [this] { window_->PostMessage(kMsgPlayMode); });
    layout->addWidget(label);
    layout->addWidget(playModePopup_);
    return popup;
}

void ControlRow::AddRangeFields(QHBoxLayout* layout)
{
    const QString digits = QStringLiteral("0123456789-");
    rangeStartField_ = new TextControl(QStringLiteral("Range Start:"), QStringLiteral("-1"),
        Message(kMsgSetRangeStart), window_, this);
    rangeStartField_->AllowOnly(digits);
    layout->addWidget(rangeStartField_);
    layout->addSpacing(kRangeFieldGap);
    rangeEndField_ = new TextControl(QStringLiteral("Range End:"), QStringLiteral("-1"),
        Message(kMsgSetRangeEnd), window_, this);
    rangeEndField_->AllowOnly(digits);
    layout->addWidget(rangeEndField_);
}

TransportButton* ControlRow::TransportButtonNamed(const QString& name) const
{
    for (TransportButton* button : {static_cast<TransportButton*>(play_), static_cast<TransportButton*>(playMode_),
             static_cast<TransportButton*>(stop_)}) {
        if (button->objectName() == name)
            return button;
    }
    return nullptr;
}

}  // namespace glimmet
