#pragma once

#include <memory>

class QWidget;

namespace glimmet {

class ActionRunner;
class ChannelManager;
class CommandTable;
class CopyBuffer;
class Message;
class MessageTarget;
class StretchProgress;

/// The rows of a document window's command table that edit the document:
/// copy, the commands that make an action, the action lifecycle, undo and
/// redo.
///
/// GUI thread only.
class EditCommands {
public:
    /// window is handed to every action for its parameter dialog, which
    /// belongs to dialogParent (the same window as a widget; null in tests
    /// without one). copyBuffer is the application's, shared by all windows;
    /// null copies and pastes nothing.
    EditCommands(MessageTarget& window, QWidget* dialogParent, ChannelManager& manager, ActionRunner& actions,
        CopyBuffer* copyBuffer);
    ~EditCommands();
    EditCommands(const EditCommands&) = delete;
    EditCommands& operator=(const EditCommands&) = delete;

    /// Adds the edit commands to table.
    void AddTo(CommandTable& table);

    /// Copies the range of every selected channel into the copy buffer; with
    /// no channel selected the buffer stays as it was.
    void Copy();

    const CopyBuffer* SharedCopyBuffer() const { return copyBuffer_; }

private:
    void AddActionCommands(CommandTable& table);
    /// The effects that ask for a curve in a dialog first.
    void AddCurveEffectCommands(CommandTable& table);
    /// 'tstr': the time stretch with its dialog open.
    void TimeStretch();
    void Cut();
    void Paste();
    /// 'smmd' from a channel's view: the drag of one sample, as an action
    /// bound to its channel rather than to the range.
    void SampleMoved(const Message& message);

    MessageTarget& window_;
    QWidget* dialogParent_;
    ChannelManager& manager_;
    ActionRunner& actions_;
    CopyBuffer* copyBuffer_;
    std::unique_ptr<StretchProgress> progress_;
};

}  // namespace glimmet
