#include "app/TextControl.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QRegularExpression>
#include <QRegularExpressionValidator>

#include "support/MessageTarget.h"

namespace glimmet {

TextControl::TextControl(const QString& label, const QString& text, Message message, MessageTarget* target,
    QWidget* parent)
    : QWidget(parent),
      label_(new QLabel(label, this)),
      field_(new QLineEdit(text, this)),
      message_(std::move(message)),
      target_(target)
{
    auto* layout = new QHBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->addWidget(label_);
    layout->addWidget(field_, 1);
    label_->setBuddy(field_);
    connect(field_, &QLineEdit::returnPressed, this, &TextControl::EntryFinished);
    connect(field_, &QLineEdit::editingFinished, this, &TextControl::EntryFinished);
}

QString TextControl::Text() const
{
    return field_->text();
}

void TextControl::SetText(const QString& text)
{
    field_->setText(text);
    ShowStartUnlessEditing();
}

// A number wider than the field shows its leading digits, which tell it
// apart, unless the user is at work in the field.
void TextControl::ShowStartUnlessEditing()
{
    if (!field_->hasFocus())
        field_->setCursorPosition(0);
}

void TextControl::AllowOnly(const QString& allowed)
{
    const QRegularExpression pattern("[" + QRegularExpression::escape(allowed) + "]*");
    field_->setValidator(new QRegularExpressionValidator(pattern, field_));
}

void TextControl::EntryFinished()
{
    ShowStartUnlessEditing();
    // editingFinished also fires when focus leaves an unchanged field; only a
    // real entry is a command.
    if (!field_->isModified())
        return;
    field_->setModified(false);
    if (target_ != nullptr)
        target_->PostMessage(message_);
}

}  // namespace glimmet
