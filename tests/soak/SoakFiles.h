#pragma once

#include <cstdint>
#include <filesystem>
#include <vector>

#include "SoakModel.h"
#include "edit/TestDocument.h"
#include "edit/HistoryManager.h"

namespace glimmet::test {

/// The soak's save steps: the document saved through the file layer and
/// opened again, and what the model expects of that, written out from the
/// rules of the save mix independently of the mixer.
class SoakFiles {
public:
    /// Frames the save mixes at a time.
    static constexpr int64_t kFramesPerBuffer = 1024;
    /// Longer documents are not saved: their file would not be a soak's.
    static constexpr int64_t kLongestSave = int64_t(1) << 24;
    /// The stereo 16-bit mix of channels from frame 0 to the end of the
    /// longest: left samples, then right samples.
    static std::vector<std::vector<int16_t>> SaveMix(const std::vector<SoakChannel>& channels);
    /// The channels opening a stereo file of mix gives: left panned left,
    /// right panned right, from frame 0, neither muted nor selected.
    static std::vector<SoakChannel> Opened(const std::vector<std::vector<int16_t>>& mix);
    /// The soft clipping a side of two or more channels goes through.
    static float SoftClip(float x);
    /// Saves document to a temporary file and opens that file into it, the
    /// history starting anew; model becomes what the file holds. What went
    /// wrong (the save, the saved mark, the opening) goes to mismatch.
    static std::string SaveAndReopen(TestDocument& document, HistoryManager& history, SoakModel& model,
        std::string& mismatch);
    /// Saves into a folder that does not exist: the save must fail and
    /// leave the history's saved mark as it was.
    static std::string FailedSave(TestDocument& document, HistoryManager& history, std::string& mismatch);
    /// A file name of this process's own in the temporary folder.
    static std::filesystem::path TemporaryPath(const char* tag);
};

}  // namespace glimmet::test
