#pragma once

#include <QObject>
#include <QString>
#include <QTimer>

class QWidget;

namespace glimmet {

class ActionRunner;

/// Shows, in its document window, that a time stretch is being computed:
/// a busy cursor over the window and the share done at the end of its
/// title ("Glimmet - take1.wav (stretching 42%)"), refreshed a few times a
/// second until the result has been written back.
class StretchProgress : public QObject {
    Q_OBJECT

public:
    /// window may be null (nothing is shown); actions is asked how far the
    /// stretch has come. Neither is owned; both outlive this.
    StretchProgress(QWidget* window, const ActionRunner& actions);

    /// Starts showing when a stretch runs, stops when none does.
    void Follow();

    /// The title with any progress note taken off.
    static QString PlainTitle(const QString& title);
    /// The title with the note for share (0 to 1).
    static QString TitleWithProgress(const QString& title, double share);

private:
    void Refresh();

    QWidget* window_;
    const ActionRunner& actions_;
    QTimer timer_;
    bool showing_ = false;
};

}  // namespace glimmet
