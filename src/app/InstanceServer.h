#pragma once

#include <QObject>
#include <QString>
#include <QStringList>

class QLocalServer;
class QLocalSocket;

namespace glimmet {

class MessageTarget;

/// Lets a second launch of the editor hand its files to the one already
/// running, so that every window lives in one process and shares one copy
/// buffer. The running instance listens on a local socket; each connection
/// carries one list of absolute paths, delivered to the target as a
/// "refs received" message (an empty list asks for a new window).
class InstanceServer : public QObject {
    Q_OBJECT

public:
    /// Starts listening under name, replacing a socket left behind by an
    /// instance that died. target is not owned.
    InstanceServer(const QString& name, MessageTarget* target, QObject* parent = nullptr);
    ~InstanceServer() override;

    bool IsListening() const;

    /// The socket name of this user's editor; GLIMMET_INSTANCE overrides it
    /// (tests, or a user who wants separate instances).
    static QString DefaultName();

    /// Sends paths to the instance listening under name. False when none is
    /// running (then this process becomes the instance). Waits at most
    /// timeoutMs for each step.
    static bool ForwardToRunningInstance(const QString& name, const QStringList& paths, int timeoutMs = 2000);

private:
    void Accept();
    void Deliver(QLocalSocket* socket);

    QLocalServer* server_;
    MessageTarget* target_;
};

}  // namespace glimmet
