#pragma once

#include <QLabel>
#include <QObject>
#include <QPointer>
#include <QString>
#include <QTimer>

#include <cstdint>
#include <deque>
#include <filesystem>
#include <memory>


class QWidget;

namespace glimmet {

class BackgroundLoad;
class LoadTarget;
class Locker;

/// The files a document window is loading, one after the other, each on a
/// worker thread (BackgroundLoad), with a progress line over the channel
/// views while one runs. The window keeps painting and handling commands
/// meanwhile; its document changes only when a load is complete.
///
/// GUI thread only.
class LoadQueue : public QObject {
    Q_OBJECT

public:
    /// How often the progress line is refreshed and a finished load looked
    /// for.
    static constexpr int kPollMilliseconds = 30;

    /// target is the window the files load into, windowLock the lock held
    /// around a dispatch (taken while a load is handed over); the progress
    /// line becomes a child of progressParent. None is owned.
    LoadQueue(LoadTarget& target, Locker& windowLock, QWidget* progressParent);
    /// Cancels the running load and drops the waiting ones.
    ~LoadQueue() override;

    /// Queues file, with the append flag as it is now; starts it at once when
    /// nothing else is loading.
    void Open(const std::filesystem::path& file, bool append, bool hasDocument);
    /// A load is running or waiting.
    bool IsLoading() const { return running_ != nullptr || !waiting_.empty(); }
    /// The progress line (hidden when nothing loads); may be null once its
    /// parent is gone.
    QLabel* ProgressLine() const { return line_.data(); }

    /// Loads queued in any window and not yet handed over; a script waits
    /// for this to reach 0 before its next line.
    static int32_t CountInFlight();

private:
    struct Waiting {
        std::filesystem::path file;
        bool append;
        bool hasDocument;
    };

    void Poll();
    void StartNext();
    void HandOver();
    void ShowProgress();

    LoadTarget& target_;
    Locker& windowLock_;
    QPointer<QLabel> line_;
    QTimer timer_;
    std::unique_ptr<BackgroundLoad> running_;
    std::deque<Waiting> waiting_;
};

}  // namespace glimmet
