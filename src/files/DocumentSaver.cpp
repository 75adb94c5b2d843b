#include "files/DocumentSaver.h"

#include <mutex>
#include <system_error>

#include "edit/HistoryManager.h"
#include "files/AsyncFrameWriter.h"
#include "files/FileTypeAttribute.h"
#include "files/SaveDestination.h"
#include "files/SaveTarget.h"
#include "files/WavFileWriter.h"
#include "sound/ChannelManager.h"

namespace glimmet {

status_t DocumentSaver::SaveFile(const std::filesystem::path& file, SaveTarget& target)
{
    bool written = false;
    const status_t status = SaveFile(file, target.DocumentManager(), target.DocumentHistory(), &written);
    // Until the document is all in the file there is something to save.
    target.SetSaveItemEnabled(!written);
    return status;
}

status_t DocumentSaver::SaveFile(const std::filesystem::path& file, ChannelManager* document,
                                 HistoryManager* history, bool* written)
{
    if (written != nullptr)
        *written = false;
    std::filesystem::path destination;
    status_t status = SaveDestination::Resolve(file, &destination);
    if (status == B_OK)
        status = WriteFile(destination, document);
    if (status != B_OK)
        return status;
    if (history != nullptr)
        history->Save();
    if (written != nullptr)
        *written = true;
    return SetTypeOfSavedFile(destination);
}

status_t DocumentSaver::WriteFile(const std::filesystem::path& destination, ChannelManager* document)
{
    WavFileWriter writer(destination);
    if (writer.CommitHeader() == B_OK) {
        // The file is written on a second thread while the mix goes on.
        AsyncFrameWriter background(writer);
        WriteDocument(document, background);
        background.Close();
    }
    // The writer remembers its first failure, whichever thread met it.
    return writer.Finish();
}

status_t DocumentSaver::SetTypeOfSavedFile(const std::filesystem::path& destination)
{
    // A directory or device in the way was never written to, and must not
    // be labelled as a sound file either.
    std::error_code error;
    const auto status = std::filesystem::status(destination, error);
    if (!std::filesystem::exists(status))
        return B_ENTRY_NOT_FOUND;
    if (std::filesystem::is_directory(status))
        return B_IS_A_DIRECTORY;
    if (!std::filesystem::is_regular_file(status))
        return B_BAD_VALUE;
    return SetFileType(destination, kWavType);
}

status_t DocumentSaver::WriteDocument(ChannelManager* manager, FrameWriter& writer)
{
    if (manager == nullptr)
        return B_OK;
    int16_t buffer[kFramesPerBuffer * 2];
    std::lock_guard documentLock(manager->DocumentLock());
    manager->SetCurrentFrame(0);
    const int64_t total = manager->FrameCount();
    int64_t written = 0;
    while (written < total) {
        int64_t frames = kFramesPerBuffer;
        if (!manager->FillBuffer(buffer, &frames))
            break;
        const status_t status = writer.WriteFrames(buffer, frames);
        if (status != B_OK)
            return status;
        written += frames;
    }
    return B_OK;
}

}  // namespace glimmet
