#pragma once

#include <QCoreApplication>
#include <QElapsedTimer>
#include <QEvent>
#include <QEventLoop>
#include <QTemporaryDir>

#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "app/LoadQueue.h"
#include "app/Quillex.h"
#include "app/QuillexWindow.h"

namespace glimmet::test {

/// Delivers everything posted so far, including deferred deletions, until
/// nothing new turns up.
inline void DrainPosted()
{
    for (int round = 0; round < 20; ++round) {
        QCoreApplication::sendPostedEvents();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        QCoreApplication::processEvents();
    }
}

/// DrainPosted, and first every file a window was asked to open is put in
/// its document (windows load on worker threads).
inline void Drain(int64_t loadLimitMilliseconds = 30000)
{
    DrainPosted();
    QElapsedTimer timer;
    timer.start();
    while (LoadQueue::CountInFlight() > 0 && timer.elapsed() < loadLimitMilliseconds)
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents, LoadQueue::kPollMilliseconds);
    DrainPosted();
}

/// Records an edit in the window's history that the document has not
/// been saved since.
void MakeUnsaved(QuillexWindow* window);

class AppFixture;
/// A window of the fixture's application, loaded with a file when one is
/// given.
QuillexWindow* OpenWindow(AppFixture& fixture, const std::filesystem::path& file = {});
/// Whether the window is still in the application's list.
bool IsListed(AppFixture& fixture, QuillexWindow* window);

/// Writes a 16-bit PCM WAV file; channels[c][f] is frame f of channel c.
void WriteWav(const std::filesystem::path& path, const std::vector<std::vector<int16_t>>& channels,
    uint32_t rate = 44100);

/// Reads back a 16-bit PCM WAV file written by anyone, channel by channel.
std::vector<std::vector<int16_t>> ReadWav(const std::filesystem::path& path);

/// An application object with a quit hook that only counts, a temporary
/// folder for fixtures, and a save question that fails the test if asked
/// unexpectedly.
class AppFixture {
public:
    AppFixture();
    ~AppFixture();

    Quillex& App() { return *application_; }
    int QuitCount() const { return quits_; }
    std::filesystem::path Dir() const { return std::filesystem::path(dir_.path().toStdString()); }
    /// A mono or stereo fixture file in the temporary folder.
    std::filesystem::path MakeSound(const std::string& name, int channels = 1, int frames = 100);

private:
    QTemporaryDir dir_;
    std::unique_ptr<Quillex> application_;
    int quits_ = 0;
};

}  // namespace glimmet::test
