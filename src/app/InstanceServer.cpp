#include "app/InstanceServer.h"

#include <QDataStream>
#include <QLocalServer>
#include <QLocalSocket>
#include <QVariant>

#include <filesystem>

#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageTarget.h"

namespace glimmet {

namespace {

// Bumped whenever what travels over the socket changes.
constexpr qint32 kProtocolVersion = 1;

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
    QByteArray payload;
    QDataStream stream(&payload, QIODevice::WriteOnly);
    stream << kProtocolVersion << paths;
    socket.write(payload);
    if (!socket.waitForBytesWritten(timeoutMs))
        return false;
    socket.disconnectFromServer();
    if (socket.state() != QLocalSocket::UnconnectedState)
        socket.waitForDisconnected(timeoutMs);
    return true;
}

void InstanceServer::Accept()
{
    while (QLocalSocket* socket = server_->nextPendingConnection()) {
        // The sender disconnects once everything is written.
        connect(socket, &QLocalSocket::disconnected, this, [this, socket] { Deliver(socket); });
        if (socket->state() == QLocalSocket::UnconnectedState)
            Deliver(socket);
    }
}

void InstanceServer::Deliver(QLocalSocket* socket)
{
    if (socket->property("delivered").toBool())
        return;
    socket->setProperty("delivered", true);
    QDataStream stream(socket->readAll());
    qint32 version = 0;
    QStringList paths;
    stream >> version >> paths;
    socket->deleteLater();
    if (stream.status() != QDataStream::Ok || version != kProtocolVersion || target_ == nullptr)
        return;
    if (paths.isEmpty()) {
        target_->PostMessage(kMsgNewWindow);
        return;
    }
    Message refs(kMsgRefsReceived);
    for (const QString& path : paths)
        refs.AddPath("refs", std::filesystem::path(path.toStdString()));
    target_->PostMessage(refs);
}

}  // namespace glimmet
