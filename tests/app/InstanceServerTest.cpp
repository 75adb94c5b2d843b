#include <gtest/gtest.h>

#include <QFile>
#include <QLocalSocket>
#include <QProcess>
#include <QTest>
#include <QUuid>

#include <atomic>
#include <string>
#include <thread>

#include "AppTestSupport.h"
#include "app/InstanceServer.h"

namespace glimmet::test {
namespace {

QString UniqueName()
{
    return QStringLiteral("glimmet-test-") + QUuid::createUuid().toString(QUuid::WithoutBraces);
}

/// Forwards from another thread, as a second process would, while this
/// thread's event loop serves the running instance.
bool ForwardWhileServing(const QString& name, const QStringList& paths)
{
    std::atomic<bool> done{false};
    bool forwarded = false;
    std::thread launch([&] {
        forwarded = InstanceServer::ForwardToRunningInstance(name, paths);
        done = true;
    });
    EXPECT_TRUE(QTest::qWaitFor([&] { return done.load(); }, 10000));
    launch.join();
    Drain();
    return forwarded;
}

TEST(InstanceServer, WithoutARunningInstanceNothingIsForwarded)
{
    EXPECT_FALSE(InstanceServer::ForwardToRunningInstance(UniqueName(), {"/tmp/x.wav"}, 200));
}

TEST(InstanceServer, ASecondLaunchOpensItsFilesInTheRunningInstance)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    const QString name = UniqueName();
    InstanceServer server(name, &fixture.App());
    ASSERT_TRUE(server.IsListening());
    const auto file = fixture.MakeSound("handed.wav", 2);
    ASSERT_TRUE(ForwardWhileServing(name, {QString::fromStdString(file.string())}));
    EXPECT_TRUE(QTest::qWaitFor([&] { return fixture.App().CountWindows() == 2; }, 2000));
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 2);
    EXPECT_EQ(fixture.App().WindowAt(1)->FileEntry(), file);
    EXPECT_EQ(fixture.App().WindowAt(1)->windowTitle(), "Glimmet - handed.wav");
}

TEST(InstanceServer, ASecondLaunchWithoutFilesOpensANewWindow)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    const QString name = UniqueName();
    InstanceServer server(name, &fixture.App());
    ASSERT_TRUE(ForwardWhileServing(name, {}));
    EXPECT_TRUE(QTest::qWaitFor([&] { return fixture.App().CountWindows() == 2; }, 2000));
    EXPECT_EQ(fixture.App().CountWindows(), 2);
}

TEST(InstanceServer, TheGlimmetProgramHandsItsFileToTheRunningInstance)
{
    const QString program = QCoreApplication::applicationDirPath() + "/../glimmet";
    ASSERT_TRUE(QFile::exists(program)) << program.toStdString();
    AppFixture fixture;
    fixture.App().ReadyToRun();
    const QString name = UniqueName();
    InstanceServer server(name, &fixture.App());
    const auto file = fixture.MakeSound("launched.wav", 1);

    QProcess launch;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    environment.insert("GLIMMET_INSTANCE", name);
    environment.insert("QT_QPA_PLATFORM", "offscreen");
    launch.setProcessEnvironment(environment);
    launch.setWorkingDirectory(QString::fromStdString(fixture.Dir().string()));
    launch.start(program, {"launched.wav"});
    ASSERT_TRUE(launch.waitForStarted(5000));
    ASSERT_TRUE(QTest::qWaitFor([&] { return launch.state() == QProcess::NotRunning; }, 30000));
    EXPECT_EQ(launch.exitCode(), 0);
    EXPECT_TRUE(QTest::qWaitFor([&] { return fixture.App().CountWindows() == 2; }, 2000));
    Drain();
    ASSERT_EQ(fixture.App().CountWindows(), 2);
    EXPECT_EQ(fixture.App().WindowAt(1)->FileEntry(), file);
}

TEST(InstanceServer, GarbageOnTheSocketIsIgnored)
{
    AppFixture fixture;
    fixture.App().ReadyToRun();
    const QString name = UniqueName();
    InstanceServer server(name, &fixture.App());
    std::thread sender([&] {
        QLocalSocket socket;
        socket.connectToServer(name);
        if (socket.waitForConnected(2000)) {
            socket.write("not a list of files");
            socket.waitForBytesWritten(2000);
            socket.disconnectFromServer();
        }
    });
    QTest::qWait(300);
    sender.join();
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 1);
}

TEST(InstanceServer, AStateRequestIsAnsweredByTheReporter)
{
    AppFixture fixture;
    const QString name = UniqueName();
    InstanceServer server(name, &fixture.App());
    server.SetStateReporter([] { return std::string("{\"title\": \"one\"}\n{\"title\": \"two\"}\n"); });
    std::atomic<bool> done{false};
    std::string state;
    bool answered = false;
    std::thread asker([&] {
        answered = InstanceServer::QueryState(name, &state);
        done = true;
    });
    EXPECT_TRUE(QTest::qWaitFor([&] { return done.load(); }, 10000));
    asker.join();
    EXPECT_TRUE(answered);
    EXPECT_EQ(state, "{\"title\": \"one\"}\n{\"title\": \"two\"}\n");
    // A state request opens nothing.
    Drain();
    EXPECT_EQ(fixture.App().CountWindows(), 0);
}

TEST(InstanceServer, WithoutARunningInstanceTheStateIsNotAnswered)
{
    std::string state = "untouched";
    EXPECT_FALSE(InstanceServer::QueryState(UniqueName(), &state, 200));
    EXPECT_EQ(state, "untouched");
}

}  // namespace
}  // namespace glimmet::test
