#pragma once

#include <QObject>
#include <QString>
#include <QStringList>

#include <functional>
#include <string>

class QLocalServer;
class QLocalSocket;

namespace glimmet {

class MessageTarget;

/// Lets a second launch of the editor hand its files to the one already
/// running, so that every window lives in one process and shares one copy
/// buffer. The running instance listens on a local socket; each connection
/// carries one list of absolute paths, delivered to the target as a
/// "refs received" message (an empty list asks for a new window).
///
/// A connection may instead ask for the state of every open window (one
/// line of JSON each, as the batch mode prints it), which lets scripts and
/// tests check what a window did after driving it with the mouse and keys.
class InstanceServer : public QObject {
    Q_OBJECT

public:
    /// Starts listening under name, replacing a socket left behind by an
    /// instance that died. target is not owned.
    InstanceServer(const QString& name, MessageTarget* target, QObject* parent = nullptr);
    ~InstanceServer() override;

    bool IsListening() const;

    /// What answers a state request: every window's state, one line each.
    using StateReporter = std::function<std::string()>;
    void SetStateReporter(StateReporter reporter) { stateReporter_ = std::move(reporter); }

    /// The socket name of this user's editor; GLIMMET_INSTANCE overrides it
    /// (tests, or a user who wants separate instances).
    static QString DefaultName();

    /// Sends paths to the instance listening under name. False when none is
    /// running (then this process becomes the instance). Waits at most
    /// timeoutMs for each step.
    static bool ForwardToRunningInstance(const QString& name, const QStringList& paths, int timeoutMs = 2000);
    /// Asks the instance listening under name for its windows' state. False
    /// when none answers within timeoutMs.
    static bool QueryState(const QString& name, std::string* state, int timeoutMs = 5000);

private:
    void Accept();
    void Deliver(QLocalSocket* socket);
    void AnswerStateRequest(QLocalSocket* socket);

    QLocalServer* server_;
    MessageTarget* target_;
    StateReporter stateReporter_;
};

}  // namespace glimmet
