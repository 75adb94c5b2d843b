#pragma once

#include <cstdint>
#include <string>

namespace glimmet {

/// Builds a 32-bit message code from its four characters, first character in
/// the most significant byte, so that codes print and sort as they read.
constexpr uint32_t FourCharCode(const char (&text)[5])
{
    return (uint32_t(uint8_t(text[0])) << 24) | (uint32_t(uint8_t(text[1])) << 16)
        | (uint32_t(uint8_t(text[2])) << 8) | uint32_t(uint8_t(text[3]));
}

/// The four characters of a code, for diagnostics and scripts.
std::string FourCharText(uint32_t code);

// Every command code the program sends or handles, in one place.

// Application.
inline constexpr uint32_t kMsgNewWindow = FourCharCode("neww");
inline constexpr uint32_t kMsgOpen = FourCharCode("open");
inline constexpr uint32_t kMsgDeleteWindow = FourCharCode("delw");
inline constexpr uint32_t kMsgToggleBubbleHelp = FourCharCode("dtbh");
inline constexpr uint32_t kMsgFeedback = FourCharCode("fdbk");
inline constexpr uint32_t kMsgAboutRequested = FourCharCode("_ABR");
inline constexpr uint32_t kMsgQuitRequested = FourCharCode("_QRQ");
inline constexpr uint32_t kMsgCancel = FourCharCode("_CNC");
inline constexpr uint32_t kMsgRefsReceived = FourCharCode("_RRC");
inline constexpr uint32_t kMsgHelp = FourCharCode("help");

// Standard editing commands.
inline constexpr uint32_t kMsgCut = FourCharCode("CCUT");
inline constexpr uint32_t kMsgCopy = FourCharCode("COPY");
inline constexpr uint32_t kMsgPaste = FourCharCode("PSTE");
inline constexpr uint32_t kMsgSelectAll = FourCharCode("SALL");
inline constexpr uint32_t kMsgSimpleData = FourCharCode("DATA");

// Document window: files and history.
inline constexpr uint32_t kMsgAppend = FourCharCode("apop");
inline constexpr uint32_t kMsgSave = FourCharCode("save");
inline constexpr uint32_t kMsgSaveAs = FourCharCode("saas");
inline constexpr uint32_t kMsgSavePanelChoice = FourCharCode("svfp");
inline constexpr uint32_t kMsgUndo = FourCharCode("undo");
inline constexpr uint32_t kMsgRedo = FourCharCode("redo");
inline constexpr uint32_t kMsgClearHistory = FourCharCode("club");
inline constexpr uint32_t kMsgActionGo = FourCharCode("acgo");
inline constexpr uint32_t kMsgActionCancel = FourCharCode("accc");

// Edits and effects.
inline constexpr uint32_t kMsgRemove = FourCharCode("rmov");
inline constexpr uint32_t kMsgTruncate = FourCharCode("trnc");
inline constexpr uint32_t kMsgFadeIn = FourCharCode("fdin");
inline constexpr uint32_t kMsgFadeOut = FourCharCode("fdot");
inline constexpr uint32_t kMsgMaximize = FourCharCode("maxi");
inline constexpr uint32_t kMsgRevert = FourCharCode("rvrt");
inline constexpr uint32_t kMsgRevertPhases = FourCharCode("rvph");
inline constexpr uint32_t kMsgFilter = FourCharCode("fltr");
inline constexpr uint32_t kMsgDistort = FourCharCode("dist");
inline constexpr uint32_t kMsgCompressor = FourCharCode("comp");
inline constexpr uint32_t kMsgEnvelope = FourCharCode("enlp");
inline constexpr uint32_t kMsgTimeStretch = FourCharCode("tstr");
// A time stretch's worker has finished; the window writes the result back.
inline constexpr uint32_t kMsgStretchFinished = FourCharCode("tsfn");

// Channels.
inline constexpr uint32_t kMsgAddChannel = FourCharCode("addc");
inline constexpr uint32_t kMsgRemoveChannel = FourCharCode("remc");
inline constexpr uint32_t kMsgToggleMute = FourCharCode("much");
inline constexpr uint32_t kMsgPanLeft = FourCharCode("stcl");
inline constexpr uint32_t kMsgPanMiddle = FourCharCode("stcm");
inline constexpr uint32_t kMsgPanRight = FourCharCode("stcr");
inline constexpr uint32_t kMsgSampleMoved = FourCharCode("smmd");
inline constexpr uint32_t kMsgMovingSample = FourCharCode("mvsm");

// Range, view and selection.
inline constexpr uint32_t kMsgRangeStartChanged = FourCharCode("rsch");
inline constexpr uint32_t kMsgRangeEndChanged = FourCharCode("rech");
inline constexpr uint32_t kMsgSetRangeStart = FourCharCode("strs");
inline constexpr uint32_t kMsgSetRangeEnd = FourCharCode("stre");
inline constexpr uint32_t kMsgSelectNone = FourCharCode("slno");
inline constexpr uint32_t kMsgShowAll = FourCharCode("shal");
inline constexpr uint32_t kMsgZoomRange = FourCharCode("zora");
inline constexpr uint32_t kMsgSetDisplayRange = FourCharCode("stdr");
inline constexpr uint32_t kMsgDisplayRangeChanged = FourCharCode("dprs");
inline constexpr uint32_t kMsgFirstTick = FourCharCode("ftck");
inline constexpr uint32_t kMsgTick = FourCharCode("tick");

// Playback.
inline constexpr uint32_t kMsgPlay = FourCharCode("play");
inline constexpr uint32_t kMsgPlayFromCursor = FourCharCode("pfcr");
inline constexpr uint32_t kMsgTogglePlay = FourCharCode("cnpl");
inline constexpr uint32_t kMsgStop = FourCharCode("stop");
inline constexpr uint32_t kMsgUpdatePlaymark = FourCharCode("udpm");
inline constexpr uint32_t kMsgPlaymarkUpdated = FourCharCode("pmup");
inline constexpr uint32_t kMsgPlayMode = FourCharCode("plmd");
inline constexpr uint32_t kMsgLoop = FourCharCode("loop");

// Open panel preview.
inline constexpr uint32_t kMsgPreviewPlay = FourCharCode("plst");
inline constexpr uint32_t kMsgPreviewButtonUpdate = FourCharCode("btup");

// About box animation.
inline constexpr uint32_t kMsgAboutDraw = FourCharCode("draw");
inline constexpr uint32_t kMsgAboutNext = FourCharCode("next");
inline constexpr uint32_t kMsgAboutWait = FourCharCode("wait");

// Notification of observers.
inline constexpr uint32_t kMsgObserverUpdate = FourCharCode("obup");

}  // namespace glimmet
