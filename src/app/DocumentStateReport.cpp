#include "app/DocumentStateReport.h"

#include <QCheckBox>
#include <QComboBox>
#include <QLineEdit>
#include <QPushButton>

#include <cstdint>
#include <cstdio>
#include <mutex>
#include <sstream>

#include "app/DialogInput.h"
#include "app/DialogScriptCommands.h"
#include "app/Quillex.h"
#include "app/QuillexWindow.h"
#include "app/TextControl.h"
#include "edit/HistoryManager.h"
#include "files/panel/SndFilePanel.h"
#include "edit/dialogs/CurveParameterWindow.h"
#include "edit/dialogs/FParameterWindow.h"
#include "edit/dialogs/SpinButton.h"
#include "edit/dialogs/TSParameterWindow.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "views/ChannelContainerView.h"
#include "views/ZoomSlider.h"
#include "views/PlayButton.h"
#include "views/PlayModeButton.h"
#include "views/SampleView.h"
#include "views/SplineControl.h"
#include "views/StopButton.h"

namespace glimmet {

namespace {

const char* Boolean(bool value)
{
    return value ? "true" : "false";
}

std::string NameOrNull(const char* name)
{
    return name != nullptr ? DocumentStateReport::Quoted(name) : std::string("null");
}

const char* PlayModeName(int index)
{
    switch (index) {
    case 1:
        return "range";
    case 2:
        return "visible";
    default:
        return "all";
    }
}

void WriteTransport(std::ostringstream& out, QuillexWindow& window)
{
    PlayModeButton* playMode = window.GetPlayModeButton();
    PlayButton* play = window.GetPlayButton();
    const bool enabled = playMode->IsEnabled() && play->IsEnabled() && window.GetStopButton()->IsEnabled();
    out << ", \"transport\": {\"play mode\": " << playMode->Mode() << ", \"play\": " << play->Mode()
        << ", \"enabled\": " << Boolean(enabled) << '}';
}

/// The centre of a transport button on the screen.
void WriteButtonCentre(std::ostringstream& out, const char* name, QWidget* button)
{
    const QPoint centre = button->mapToGlobal(button->rect().center());
    out << '"' << name << "\": [" << centre.x() << ", " << centre.y() << ']';
}

void WriteChannel(std::ostringstream& out, Channel& channel, SampleView* view, QuillexWindow& window)
{
    out << "{\"first\": " << channel.FirstFrame() << ", \"frames\": " << channel.FrameCount()
        << ", \"muted\": " << Boolean(channel.IsMuted()) << ", \"pan\": " << int(channel.PanPosition())
        << ", \"selected\": " << Boolean(channel.IsSelected())
        << ", \"focused\": " << Boolean(view != nullptr && view->IsFocus()) << ", \"view\": ";
    if (view == nullptr) {
        out << "null}";
        return;
    }
    const QPoint origin = view->mapTo(&window, QPoint(0, 0));
    out << '[' << origin.x() << ", " << origin.y() << ", " << view->width() << ", " << view->height() << "]}";
}

}  // namespace

std::string DocumentStateReport::Quoted(const std::string& text)
{
    std::string quoted = "\"";
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (c == '"' || c == '\\') {
            quoted += '\\';
            quoted += c;
        } else if (byte < 0x20) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\u%04x", unsigned(byte));
            quoted += escape;
        } else {
            quoted += c;
        }
    }
    return quoted + '"';
}

std::string DocumentStateReport::Json(QuillexWindow& window)
{
    // The history's own lock comes before the document lock.
    HistoryManager* history = window.History();
    const std::string undo = NameOrNull(history->UndoName());
    const std::string redo = NameOrNull(history->RedoName());
    const bool saved = history->IsSaved();

    ChannelManager* manager = window.Manager();
    ChannelContainerView* container = window.ContainerView();
    std::lock_guard documentLock(manager->DocumentLock());
    std::ostringstream out;
    out << "{\"title\": " << Quoted(window.windowTitle().toStdString()) << ", \"frames\": " << manager->FrameCount()
        << ", \"range\": [" << manager->RangeStart() << ", " << manager->RangeEnd() << "]"
        << ", \"cursor\": " << container->CursorFrame() << ", \"playmark\": " << container->PlaymarkFrame()
        << ", \"display\": [" << container->FirstDisplayedFrame() << ", " << container->LastDisplayedFrame() << "]"
        << ", \"slider\": [" << window.GetZoomSlider()->FirstFrame() << ", " << window.GetZoomSlider()->LastFrame()
        << "]"
        << ", \"playmode\": \"" << PlayModeName(window.PlayModePopup()->currentIndex()) << '"'
        << ", \"loop\": " << Boolean(window.LoopBox()->isChecked());
    WriteTransport(out, window);
    out << ", \"undo\": " << undo << ", \"redo\": " << redo << ", \"saved\": " << Boolean(saved) << ", \"channels\": [";
    for (int32_t index = 0; Channel* channel = manager->ChannelAt(index); ++index) {
        if (index > 0)
            out << ", ";
        WriteChannel(out, *channel, container->SampleViewAtIndex(index), window);
    }
    out << "]}";
    return out.str();
}

std::string DocumentStateReport::DialogJson(TSParameterWindow* dialog)
{
    if (dialog == nullptr)
        return "{\"title\": null}";
    std::ostringstream out;
    out << "{\"title\": " << Quoted(dialog->windowTitle().toStdString()) << ", \"fields\": {";
    for (int i = 0; i < TSParameterWindow::kFieldCount; i++) {
        out << (i == 0 ? "" : ", ") << Quoted(TSParameterWindow::Labels()[size_t(i)].toStdString()) << ": "
            << Quoted(dialog->Field(i)->text().toStdString());
    }
    out << "}}";
    return out.str();
}

std::string DocumentStateReport::DialogJson(CurveParameterWindow* dialog, bool onScreen)
{
    if (dialog == nullptr)
        return "{\"title\": null}";
    std::ostringstream out;
    out << "{\"title\": " << DocumentStateReport::Quoted(dialog->windowTitle().toStdString()) << ", \"points\": [";
    const SplineControl* control = dialog->Control();
    const char* separator = "";
    for (const QPointF& point : control->ControlPoints()) {
        out << separator << '[' << DialogInput::ExactNumber(point.x()) << ", " << DialogInput::ExactNumber(point.y())
            << ']';
        separator = ", ";
    }
    out << ']';
    if (auto* filter = qobject_cast<FParameterWindow*>(dialog))
        out << ", \"passes\": " << DialogInput::ExactNumber(filter->PassesField()->value());
    out << ", \"labels\": [" << DocumentStateReport::Quoted(control->FirstLabel().toStdString()) << ", "
        << DocumentStateReport::Quoted(control->SecondLabel().toStdString()) << "]";
    if (onScreen) {
        const QRectF area = control->CurveArea();
        const QPointF topLeft = control->mapToGlobal(area.topLeft());
        const QPointF bottomRight = control->mapToGlobal(area.bottomRight());
        out << ", \"area\": [" << DialogInput::ExactNumber(topLeft.x()) << ", "
            << DialogInput::ExactNumber(topLeft.y()) << ", " << DialogInput::ExactNumber(bottomRight.x()) << ", "
            << DialogInput::ExactNumber(bottomRight.y()) << "]";
        const QPoint ok = dialog->OkButton()->mapToGlobal(dialog->OkButton()->rect().center());
        const QPoint cancel = dialog->CancelButton()->mapToGlobal(dialog->CancelButton()->rect().center());
        out << ", \"ok\": [" << ok.x() << ", " << ok.y() << "], \"cancel\": [" << cancel.x() << ", " << cancel.y()
            << "]";
    }
    out << '}';
    return out.str();
}

std::string DocumentStateReport::PanelJson(SndFilePanel* panel)
{
    if (panel == nullptr || !panel->isVisible())
        return "null";
    std::ostringstream out;
    out << "{\"title\": " << Quoted(panel->windowTitle().toStdString()) << ", \"folder\": "
        << Quoted(panel->directory().absolutePath().toStdString()) << ", \"listed\": [";
    const char* separator = "";
    for (const QString& name : panel->ListedNames()) {
        out << separator << Quoted(name.toStdString());
        separator = ", ";
    }
    out << "]}";
    return out.str();
}

std::string DocumentStateReport::OpenDialogJson(QuillexWindow& window)
{
    if (TSParameterWindow* stretch = DialogScriptCommands::OpenStretchDialog(&window))
        return DialogJson(stretch);
    return DialogJson(DialogScriptCommands::OpenDialog(&window), true);
}

std::string DocumentStateReport::LiveJson(QuillexWindow& window)
{
    std::string json = Json(window);
    json.pop_back();  // the closing brace
    const QPoint screen = window.mapToGlobal(QPoint(0, 0));
    std::ostringstream out;
    out << ", \"screen\": [" << screen.x() << ", " << screen.y() << "]"
        << ", \"active\": " << Boolean(window.isActiveWindow()) << ", \"playing\": " << Boolean(window.IsPlaying())
        << ", \"fields\": [" << Quoted(window.RangeStartField()->Text().toStdString()) << ", "
        << Quoted(window.RangeEndField()->Text().toStdString()) << "]"
        << ", \"dialog\": " << OpenDialogJson(window)
        << ", \"panel\": " << PanelJson(Quillex::Instance() != nullptr ? Quillex::Instance()->OpenPanel() : nullptr)
        << ", \"buttons\": {";
    WriteButtonCentre(out, "play", window.GetPlayButton());
    out << ", ";
    WriteButtonCentre(out, "play mode", window.GetPlayModeButton());
    out << ", ";
    WriteButtonCentre(out, "stop", window.GetStopButton());
    out << "}}";
    return json + out.str();
}

}  // namespace glimmet
