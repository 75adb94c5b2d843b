#include "app/InstanceServer.h"

#include <QLocalServer>
#include <QLocalSocket>
#include <QVariant>

#include <filesystem>

#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "support/MessageTarget.h"

namespace glimmet {

namespace {

// What travels over the socket: this header, then each path in UTF-8
// followed by a zero byte. Changed whenever the format changes.
const QByteArray kHeader = QByteArrayLiteral("glimmet-open-1\n");
// A request for the windows' state: this line alone, answered before the
// server disconnects.
const QByteArray kStateRequest = QByteArrayLiteral("glimmet-state-1\n");
// More than any command line can carry; a longer message is not ours.
constexpr qint64 kMaxMessageBytes = 16 * 1024 * 1024;

/// The paths of a message, or false when it is not a well-formed one.
bool ParsePaths(const QByteArray& data, QStringList* paths)
{
    if (!data.startsWith(kHeader))
        return false;
    const QByteArray body = data.mid(kHeader.size());
    if (!body.isEmpty() && !body.endsWith('\0'))
        return false;
    for (const QByteArray& path : body.split('\0')) {
        if (!path.isEmpty())
            *paths << QString::fromUtf8(path);
    }
    return true;
}

}  // namespace

InstanceServer::InstanceServer(const QString& name, MessageTarget* target, QObject* parent)
    : QObject(parent), server_(new QLocalServer(this)), target_(target)
{
    server_->setSocketOptions(QLocalServer::UserAccessOption);
    connect(server_, &QLocalServer::newConnection, this, &InstanceServer::Accept);
    if (!server_->listen(name)) {
        // A socket file left by a crashed instance blocks the name.
        QLocalServer::removeServer(name);
        server_->listen(name);
    }
}

InstanceServer::~InstanceServer() = default;

bool InstanceServer::IsListening() const
{
    return server_->isListening();
}

QString InstanceServer::DefaultName()
{
    const QString chosen = qEnvironmentVariable("GLIMMET_INSTANCE");
    if (!chosen.isEmpty())
        return chosen;
    QString user = qEnvironmentVariable("USER");
    if (user.isEmpty())
        user = QStringLiteral("user");
    return QStringLiteral("glimmet-") + user;
}

bool InstanceServer::ForwardToRunningInstance(const QString& name, const QStringList& paths, int timeoutMs)
{
    QLocalSocket socket;
    socket.connectToServer(name);
    if (!socket.waitForConnected(timeoutMs))
        return false;
    QByteArray payload = kHeader;
    for (const QString& path : paths)
        payload += path.toUtf8() + '\0';
    socket.write(payload);
    if (!socket.waitForBytesWritten(timeoutMs))
        return false;
    socket.disconnectFromServer();
    if (socket.state() != QLocalSocket::UnconnectedState)
        socket.waitForDisconnected(timeoutMs);
    return true;
}

bool InstanceServer::QueryState(const QString& name, std::string* state, int timeoutMs)
{
    QLocalSocket socket;
    socket.connectToServer(name);
    if (!socket.waitForConnected(timeoutMs))
        return false;
    socket.write(kStateRequest);
    if (!socket.waitForBytesWritten(timeoutMs))
        return false;
    QByteArray answer;
    while (socket.state() == QLocalSocket::ConnectedState && socket.waitForReadyRead(timeoutMs))
        answer += socket.readAll();
    answer += socket.readAll();
    *state = answer.toStdString();
    return true;
}

void InstanceServer::Accept()
{
    while (QLocalSocket* socket = server_->nextPendingConnection()) {
        socket->setReadBufferSize(kMaxMessageBytes);
        // A state request waits for its answer instead of disconnecting.
        connect(socket, &QLocalSocket::readyRead, this, [this, socket] {
            if (socket->bytesAvailable() >= kStateRequest.size() && socket->peek(kStateRequest.size()) == kStateRequest)
                AnswerStateRequest(socket);
        });
        // The sender disconnects once everything is written.
        connect(socket, &QLocalSocket::disconnected, this, [this, socket] { Deliver(socket); });
        if (socket->state() == QLocalSocket::UnconnectedState)
            Deliver(socket);
    }
}

void InstanceServer::AnswerStateRequest(QLocalSocket* socket)
{
    if (socket->property("delivered").toBool())
        return;
    socket->setProperty("delivered", true);
    socket->readAll();
    const std::string state = stateReporter_ ? stateReporter_() : std::string();
    socket->write(state.data(), qint64(state.size()));
    // The socket goes once the answer is out and the line is down.
    socket->disconnectFromServer();
}

void InstanceServer::Deliver(QLocalSocket* socket)
{
    if (socket->property("delivered").toBool()) {
        socket->deleteLater();
        return;
    }
    socket->setProperty("delivered", true);
    const QByteArray data = socket->read(kMaxMessageBytes);
    socket->deleteLater();
    QStringList paths;
    if (!ParsePaths(data, &paths) || target_ == nullptr)
        return;
    if (paths.isEmpty()) {
        target_->PostMessage(kMsgNewWindow);
        return;
    }
    Message refs(kMsgRefsReceived);
    for (const QString& path : paths)
        refs.AddPath(kFieldRefs, std::filesystem::path(path.toStdString()));
    target_->PostMessage(refs);
}

}  // namespace glimmet
