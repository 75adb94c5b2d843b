#pragma once

namespace glimmet {

class ChannelManager;
class CopyBuffer;

/// "Copy": the other half of PasteAction. Copying changes no document, so
/// it is no action and is never recorded in the history.
class SelectionCopier {
public:
    /// Copies the range of every selected channel of manager into buffer,
    /// under the document lock. With no channel selected, or a range no
    /// sample array can hold, the buffer keeps what it had and the result is
    /// false.
    static bool CopySelection(ChannelManager& manager, CopyBuffer& buffer);
};

}  // namespace glimmet
