#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <vector>

#include "support/Status.h"

namespace glimmet {

class Channel;
class ChannelManager;
class LoadTarget;
class MediaTrack;
struct media_format;

/// What loading learnt of a file, for the window that shows the document.
struct LoadReport {
    /// The file could be opened (the document may still be unchanged).
    bool opened = false;
    /// The file with its links followed.
    std::filesystem::path entry;
    /// Audio tracks that agreed to a decoded format.
    int32_t decodedTracks = 0;
    /// The document's own channels were removed for the file's: it had an
    /// audio track and the load did not append.
    bool replacedDocument = false;
    /// The file's samples would not fit in the memory that can be had: the
    /// document, its file entry and its title stay as they were.
    bool refused = false;
    /// What the samples need, when the file said so before they were
    /// decoded; -1 when the decoding found out by passing the budget.
    int64_t neededBytes = -1;
    /// What they could have had (MemoryBudget::ForSamples when the load
    /// started).
    int64_t budgetBytes = 0;
};

/// Loads a sound file into a document: every channel of every audio track
/// becomes a Channel of the document, whose views follow it. A window that
/// implements LoadTarget loads a file with `return DocumentLoader::Load(path,
/// *this);`, in its own thread.
class DocumentLoader {
public:
    /// Opens file and loads it into target. Returns the file's open status
    /// when it cannot be opened (the document is untouched), B_NO_MEMORY
    /// when its samples would not fit in the memory that can be had (the
    /// document, title and file entry are untouched, and a diagnostic says
    /// how much was needed), otherwise the
    /// status of the last decoded-format negotiation (B_OK for a file without
    /// audio). Unless target appends, each audio track first empties the
    /// document, so only the last audio track's channels remain. Each audio
    /// track that decodes posts 'shal' to the target, loaded channels or not.
    static status_t Load(const std::filesystem::path& file, LoadTarget& target);
    /// The same for a document on its own: the channels go into document
    /// (skipped when it is null), after its channels when append is set;
    /// report (may be null) takes what the window would be told.
    static status_t Load(const std::filesystem::path& file, ChannelManager* document, bool append,
                         LoadReport* report = nullptr);

    /// The channels of an audio track from one decoding pass, in track order;
    /// a channel that could not be had (no frames) is null. The result is
    /// what ChannelTrackLoader::Load gives for each channel k, without
    /// decoding the track once per channel. decoded is the format the track
    /// agreed to. Samples go straight into blocks as they decode, so memory
    /// follows what the stream holds, not what its header or the file's
    /// size claim. When the header's length or the decoded samples pass
    /// budgetBytes, the result is empty and report (may be null) says so
    /// (refused, neededBytes).
    static std::vector<std::unique_ptr<Channel>> LoadChannels(MediaTrack* track, const media_format& decoded,
                                                              int64_t budgetBytes = INT64_MAX,
                                                              LoadReport* report = nullptr);

private:
    /// The channels of the audio tracks decoded so far, not yet in the
    /// document: a file refused halfway must leave the document as it was.
    struct Staged {
        std::vector<std::unique_ptr<Channel>> channels;
        int64_t bytes = 0;
    };

    /// Loads one track into staged; *status takes the decoded-format result
    /// of an audio track. True when an audio track agreed to a decoded
    /// format.
    static bool LoadTrack(MediaTrack* track, bool hasDocument, bool append, status_t* status, LoadReport* report,
                          Staged* staged);
    /// The frames the track claims before decoding: its header's length,
    /// cut to what the file's size leaves room for where that is known.
    static int64_t ClaimedFrames(MediaTrack* track);
    static void PrintRefusal(const std::filesystem::path& file, const LoadReport& report);
    static void EmptyDocument(ChannelManager* document);
    static std::filesystem::path FollowLinks(const std::filesystem::path& file);
};

}  // namespace glimmet
