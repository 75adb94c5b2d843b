#pragma once

#include <QDialog>
#include <QString>

#include <cstdint>

class QHBoxLayout;
class QPushButton;

namespace glimmet {

class MessageTarget;

/// What every effect's parameter dialog shares: modal for its document
/// window only (other document windows keep working), "Cancel" left of the
/// default "Ok", and answers that go to the document window rather than to
/// the action: "Ok" posts 'acgo'; "Cancel", the close box and Escape post
/// 'accc'. Closing only asks; the window drops the action, and the action
/// takes the dialog away.
class ParameterDialog : public QDialog {
    Q_OBJECT

public:
    /// parent is the document window the dialog belongs to; target receives
    /// its answers (not owned, outlives the dialog).
    ParameterDialog(QWidget* parent, MessageTarget* target, const QString& title);
    ~ParameterDialog() override;

    QPushButton* OkButton() const { return ok_; }
    QPushButton* CancelButton() const { return cancel_; }

    /// Brings the dialog up at its place on the screen, at least as large as
    /// its contents need.
    void ShowAtHome();
    /// Hides the dialog now and deletes it once the event loop runs again:
    /// it may be in the middle of delivering the event that led here.
    void QuitLater();

protected:
    /// The row of the two buttons, for the subclass's layout.
    QHBoxLayout* ButtonRow() const { return buttons_; }

    void closeEvent(QCloseEvent* event) override;
    void reject() override;

private:
    void Answer(uint32_t what);

    MessageTarget* target_;
    QPushButton* cancel_;
    QPushButton* ok_;
    QHBoxLayout* buttons_;
};

}  // namespace glimmet
