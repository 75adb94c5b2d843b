#include "app/BatchRunner.h"

#include <QAction>
#include <QApplication>
#include <QCheckBox>
#include <QComboBox>
#include <QCoreApplication>
#include <QElapsedTimer>
#include <QEventLoop>
#include <QFileDialog>
#include <QImage>
#include <QKeyEvent>
#include <QLineEdit>
#include <QMenu>
#include <QPixmap>
#include <QTimer>

#include <cerrno>
#include <charconv>
#include <chrono>
#include <cstring>
#include <fstream>
#include <iostream>
#include <mutex>
#include <sstream>

#include "app/DocumentStateReport.h"
#include "app/Quillex.h"
#include "app/TextControl.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "support/MessageEvent.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

namespace glimmet {

namespace {

/// How long one line may take to settle. Work the window posts to itself
/// normally settles in a few rounds; this only ends a message loop that
/// keeps feeding itself.
constexpr int64_t kDrainLimitMilliseconds = 10000;

/// The commands a script may post to the window by their four-character
/// code.
const std::vector<uint32_t>& WindowCodes()
{
    static const std::vector<uint32_t> codes = {
        kMsgFadeIn, kMsgFadeOut, kMsgMaximize, kMsgRevert, kMsgRevertPhases, kMsgFilter, kMsgDistort,
        kMsgCompressor, kMsgEnvelope, kMsgTimeStretch, kMsgCopy, kMsgCut, kMsgPaste, kMsgRemove, kMsgTruncate,
        kMsgAddChannel, kMsgRemoveChannel, kMsgUndo, kMsgRedo, kMsgClearHistory, kMsgSelectAll, kMsgSelectNone,
        kMsgZoomRange, kMsgShowAll, kMsgPlay, kMsgPlayFromCursor, kMsgTogglePlay, kMsgStop, kMsgPlayMode,
        kMsgLoop, kMsgActionGo, kMsgActionCancel, kMsgSetRangeStart, kMsgSetRangeEnd, kMsgOpen, kMsgAppend,
        kMsgSave, kMsgSaveAs, kMsgQuitRequested,
    };
    return codes;
}

bool ParseInteger(const std::string& text, int64_t* value)
{
    const char* begin = text.data();
    const char* end = begin + text.size();
    const auto [stop, error] = std::from_chars(begin, end, *value);
    return error == std::errc() && stop == end && !text.empty();
}

bool Fail(std::string* reason, const std::string& text)
{
    *reason = text;
    return false;
}

BatchRunner::Arguments Split(const std::string& line)
{
    std::istringstream words(line);
    BatchRunner::Arguments tokens;
    std::string token;
    while (words >> token)
        tokens.push_back(token);
    return tokens;
}

bool IsSkipped(const std::string& line)
{
    const size_t first = line.find_first_not_of(" \t\r");
    return first == std::string::npos || line[first] == '#';
}

QtMessageHandler gToolkitMessages = nullptr;

/// The offscreen platform remarks on every window feature it lacks; those
/// remarks would bury a script's own error lines.
void FilterToolkitMessages(QtMsgType type, const QMessageLogContext& context, const QString& text)
{
    if (text.startsWith(QStringLiteral("This plugin does not support")))
        return;
    if (gToolkitMessages != nullptr)
        gToolkitMessages(type, context, text);
}

std::string Plural(int count, const char* noun)
{
    return std::to_string(count) + " " + noun + (count == 1 ? "" : "s");
}

}  // namespace

BatchRunner::BatchRunner(Quillex& application, QuillexWindow* window, std::FILE* output, std::FILE* errors)
    : application_(application), window_(window), output_(output), errors_(errors)
{
    AddDocumentCommands();
    AddSelectionCommands();
    AddChannelCommands();
    AddPlaybackCommands();
    AddFileCommands();
    AddOutputCommands();
    // A script cannot click the alert's buttons; it says beforehand what the
    // question is to answer. Until then the default button answers.
    QuillexWindow::SetSaveQuestion([this](QuillexWindow*) { return saveAnswer_; });
}

BatchRunner::~BatchRunner()
{
    QuillexWindow::SetSaveQuestion(nullptr);
}

void BatchRunner::AddCommand(const std::string& name, int minimum, int maximum, Command command)
{
    commands_[name] = Entry{minimum, maximum, std::move(command)};
}

int BatchRunner::Run(std::istream& script)
{
    DrainEvents();
    std::string line;
    for (int number = 1; std::getline(script, line); ++number) {
        std::string reason;
        if (!RunLine(line, &reason)) {
            std::fflush(output_);
            std::fprintf(errors_, "line %d: %s\n", number, reason.c_str());
            std::fflush(errors_);
            return kFailed;
        }
    }
    std::fflush(output_);
    return kSucceeded;
}

bool BatchRunner::RunLine(const std::string& line, std::string* reason)
{
    if (IsSkipped(line))
        return true;
    Arguments arguments = Split(line);
    const std::string name = arguments.front();
    arguments.erase(arguments.begin());
    const auto found = commands_.find(name);
    if (found == commands_.end())
        return RunMessageCode(name, arguments, reason);
    const Entry& entry = found->second;
    const int count = int(arguments.size());
    if (count < entry.minimum || (entry.maximum >= 0 && count > entry.maximum)) {
        if (entry.minimum == entry.maximum)
            return Fail(reason, name + " takes " + Plural(entry.minimum, "argument"));
        return Fail(reason, name + " takes " + std::to_string(entry.minimum) + " to "
                                + (entry.maximum < 0 ? std::string("any number of") : std::to_string(entry.maximum))
                                + " arguments");
    }
    if (!RequireWindow(reason))
        return false;
    if (!entry.run(arguments, reason))
        return false;
    DrainEvents();
    return true;
}

bool BatchRunner::RunMessageCode(const std::string& code, const Arguments& arguments, std::string* reason)
{
    if (code.size() != 4)
        return Fail(reason, "unknown command \"" + code + "\"");
    uint32_t what = 0;
    bool known = false;
    for (const uint32_t candidate : WindowCodes()) {
        if (FourCharText(candidate) == code) {
            what = candidate;
            known = true;
        }
    }
    if (!known)
        return Fail(reason, "unknown command \"" + code + "\"");
    if (!arguments.empty())
        return Fail(reason, code + " takes no arguments");
    if (!RequireWindow(reason))
        return false;
    window_->PostMessage(what);
    DrainEvents();
    return true;
}

bool BatchRunner::RequireWindow(std::string* reason) const
{
    if (window_.isNull())
        return Fail(reason, "the window is closed");
    return true;
}

bool BatchRunner::ChannelIndex(const std::string& text, int32_t* index, std::string* reason) const
{
    int64_t value = 0;
    if (!ParseInteger(text, &value))
        return Fail(reason, "\"" + text + "\" is not a channel index");
    const int32_t count = window_->Manager()->CountChannels();
    if (value < 0 || value >= count)
        return Fail(reason, "no channel " + text + " (the document has " + Plural(count, "channel") + ")");
    *index = int32_t(value);
    return true;
}

// ---------------------------------------------------------------------------
// Event loop

void BatchRunner::DrainEvents()
{
    QElapsedTimer timer;
    timer.start();
    do {
        QCoreApplication::sendPostedEvents();
        QCoreApplication::processEvents(QEventLoop::AllEvents);
    } while (MessageEvent::CountPendingFromMainThread() > 0 && timer.elapsed() < kDrainLimitMilliseconds);
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
}

void BatchRunner::Wait(int64_t milliseconds)
{
    QEventLoop loop;
    QTimer::singleShot(std::chrono::milliseconds(milliseconds), &loop, &QEventLoop::quit);
    loop.exec();
}

// ---------------------------------------------------------------------------
// Commands

void BatchRunner::AddDocumentCommands()
{
    AddCommand("range", 2, 2, [this](const Arguments& arguments, std::string* reason) {
        int64_t start = 0;
        int64_t end = 0;
        if (!ParseInteger(arguments[0], &start) || !ParseInteger(arguments[1], &end))
            return Fail(reason, "range takes two frame numbers");
        TypeIntoField(window_->RangeStartField(), arguments[0]);
        DrainEvents();
        TypeIntoField(window_->RangeEndField(), arguments[1]);
        return true;
    });
    AddCommand("cursor", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        int64_t frame = 0;
        if (!ParseInteger(arguments[0], &frame))
            return Fail(reason, "\"" + arguments[0] + "\" is not a frame number");
        window_->ContainerView()->SetCursorFrame(frame);
        return true;
    });
    AddCommand("move", 2, 2, [this](const Arguments& arguments, std::string* reason) {
        int32_t index = 0;
        int64_t frames = 0;
        if (!ChannelIndex(arguments[0], &index, reason))
            return false;
        if (!ParseInteger(arguments[1], &frames))
            return Fail(reason, "\"" + arguments[1] + "\" is not a number of frames");
        window_->ContainerView()->MoveChannel(index, frames);
        return true;
    });
    AddCommand("answer", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        if (arguments[0] == "nope")
            saveAnswer_ = QuillexWindow::kDontSave;
        else if (arguments[0] == "yes")
            saveAnswer_ = QuillexWindow::kSave;
        else if (arguments[0] == "dontquit")
            saveAnswer_ = QuillexWindow::kDontQuit;
        else
            return Fail(reason, "answer takes nope, yes or dontquit");
        return true;
    });
}

void BatchRunner::AddSelectionCommands()
{
    AddCommand("select", 0, -1, [this](const Arguments& arguments, std::string* reason) {
        ChannelManager* manager = window_->Manager();
        std::vector<bool> selected(size_t(manager->CountChannels()), false);
        for (const std::string& argument : arguments) {
            int32_t index = 0;
            if (!ChannelIndex(argument, &index, reason))
                return false;
            selected[size_t(index)] = true;
        }
        for (size_t index = 0; index < selected.size(); ++index)
            manager->ChannelAt(int32_t(index))->SetSelected(selected[index]);
        window_->ContainerView()->UpdateAll();
        return true;
    });
    AddCommand("focus", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        int32_t index = 0;
        if (!ChannelIndex(arguments[0], &index, reason))
            return false;
        window_->activateWindow();
        window_->ContainerView()->SampleViewAtIndex(index)->setFocus(Qt::OtherFocusReason);
        return true;
    });
}

void BatchRunner::AddChannelCommands()
{
    AddCommand("mute", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        int32_t index = 0;
        if (!ChannelIndex(arguments[0], &index, reason))
            return false;
        return TriggerChannelMenuItem(index, QStringLiteral("Mute"));
    });
    AddCommand("pan", 2, 2, [this](const Arguments& arguments, std::string* reason) {
        int32_t index = 0;
        if (!ChannelIndex(arguments[0], &index, reason))
            return false;
        const std::string& side = arguments[1];
        if (side != "left" && side != "middle" && side != "right")
            return Fail(reason, "pan takes left, middle or right");
        QString label = QString::fromStdString(side);
        label[0] = label[0].toUpper();
        return TriggerChannelMenuItem(index, label);
    });
}

void BatchRunner::AddPlaybackCommands()
{
    AddCommand("playmode", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        const std::vector<std::string> modes = {"all", "range", "visible"};
        for (size_t index = 0; index < modes.size(); ++index) {
            if (arguments[0] != modes[index])
                continue;
            window_->PlayModePopup()->setCurrentIndex(int(index));
            window_->PostMessage(kMsgPlayMode);
            return true;
        }
        return Fail(reason, "playmode takes all, range or visible");
    });
    AddCommand("loop", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        if (arguments[0] != "on" && arguments[0] != "off")
            return Fail(reason, "loop takes on or off");
        // A click toggles the box; a box already as asked is not clicked.
        if (window_->LoopBox()->isChecked() != (arguments[0] == "on"))
            window_->LoopBox()->click();
        return true;
    });
    AddCommand("wait", 1, 1, [](const Arguments& arguments, std::string* reason) {
        int64_t milliseconds = 0;
        if (!ParseInteger(arguments[0], &milliseconds) || milliseconds < 0 || milliseconds > 3600000)
            return Fail(reason, "wait takes a number of milliseconds from 0 to 3600000");
        Wait(milliseconds);
        return true;
    });
}

void BatchRunner::AddFileCommands()
{
    AddCommand("open", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        return OpenThroughPanel(arguments[0], reason);
    });
    AddCommand("append", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        std::filesystem::path path;
        if (!Quillex::ResolvePath(arguments[0], &path))
            return Fail(reason, "no such file: " + arguments[0]);
        Message drop(kMsgSimpleData);
        drop.AddPath("refs", path);
        drop.AddInt32("modifiers", int32_t(Qt::ShiftModifier));
        window_->PostMessage(drop);
        return true;
    });
    AddCommand("save", 0, 0, [this](const Arguments&, std::string*) {
        window_->PostMessage(kMsgSave);
        return true;
    });
    AddCommand("saveas", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        return SaveThroughPanel(arguments[0], reason);
    });
}

void BatchRunner::AddOutputCommands()
{
    AddCommand("print", 0, 0, [this](const Arguments&, std::string*) {
        const std::string json = DocumentStateReport::Json(*window_);
        std::fprintf(output_, "%s\n", json.c_str());
        std::fflush(output_);
        return true;
    });
    AddCommand("samples", 2, 2, [this](const Arguments& arguments, std::string* reason) {
        int32_t index = 0;
        if (!ChannelIndex(arguments[0], &index, reason))
            return false;
        std::ofstream file(arguments[1], std::ios::binary | std::ios::trunc);
        if (!file)
            return Fail(reason, "cannot write " + arguments[1]);
        ChannelManager* manager = window_->Manager();
        std::lock_guard documentLock(manager->DocumentLock());
        Channel* channel = manager->ChannelAt(index);
        const int16_t* samples = channel->Data();
        const int64_t count = samples != nullptr ? channel->FrameCount() : 0;
        // Little-endian whatever the machine.
        std::vector<char> bytes(size_t(count) * 2);
        for (int64_t i = 0; i < count; ++i) {
            const auto value = static_cast<uint16_t>(samples[i]);
            bytes[size_t(2 * i)] = char(value & 0xff);
            bytes[size_t(2 * i + 1)] = char(value >> 8);
        }
        file.write(bytes.data(), std::streamsize(bytes.size()));
        if (!file.flush())
            return Fail(reason, "cannot write " + arguments[1]);
        return true;
    });
    AddCommand("size", 2, 2, [this](const Arguments& arguments, std::string* reason) {
        int64_t width = 0;
        int64_t height = 0;
        if (!ParseInteger(arguments[0], &width) || !ParseInteger(arguments[1], &height) || width < 1
            || height < 1 || width > 16384 || height > 16384)
            return Fail(reason, "size takes a width and a height from 1 to 16384 pixels");
        window_->resize(int(width), int(height));
        return true;
    });
    AddCommand("snapshot", 1, 1, [this](const Arguments& arguments, std::string* reason) {
        DrainEvents();
        const QImage image = window_->grab().toImage();
        if (!image.save(QString::fromStdString(arguments[0]), "PNG"))
            return Fail(reason, "cannot write " + arguments[0]);
        return true;
    });
}

// ---------------------------------------------------------------------------
// Input as a user gives it

void BatchRunner::TypeIntoField(TextControl* control, const std::string& text)
{
    QLineEdit* field = control->Field();
    field->setFocus(Qt::OtherFocusReason);
    field->selectAll();
    for (const char c : text) {
        const QString character(QChar::fromLatin1(c));
        const int key = c == '-' ? Qt::Key_Minus : Qt::Key_0 + (c - '0');
        QKeyEvent press(QEvent::KeyPress, key, Qt::NoModifier, character);
        QCoreApplication::sendEvent(field, &press);
        QKeyEvent release(QEvent::KeyRelease, key, Qt::NoModifier, character);
        QCoreApplication::sendEvent(field, &release);
    }
    QKeyEvent enter(QEvent::KeyPress, Qt::Key_Return, Qt::NoModifier);
    QCoreApplication::sendEvent(field, &enter);
    QKeyEvent enterUp(QEvent::KeyRelease, Qt::Key_Return, Qt::NoModifier);
    QCoreApplication::sendEvent(field, &enterUp);
}

bool BatchRunner::TriggerChannelMenuItem(int32_t index, const QString& label)
{
    QMenu* menu = window_->ContainerView()->ContextMenuForChannel(index);
    if (menu == nullptr)
        return false;
    for (QAction* item : menu->actions()) {
        if (item->text() == label) {
            item->trigger();
            break;
        }
    }
    delete menu;
    return true;
}

bool BatchRunner::OpenThroughPanel(const std::string& path, std::string* reason)
{
    std::filesystem::path resolved;
    if (!Quillex::ResolvePath(path, &resolved))
        return Fail(reason, "no such file: " + path);
    std::error_code error;
    if (std::filesystem::is_directory(resolved, error))
        return Fail(reason, path + " is a folder");
    window_->PostMessage(kMsgOpen);
    DrainEvents();
    QFileDialog* panel = application_.OpenPanel();
    if (panel == nullptr || !panel->isVisible())
        return Fail(reason, "the open panel did not appear");
    panel->hide();
    emit panel->filesSelected(QStringList{QString::fromStdString(resolved.string())});
    return true;
}

bool BatchRunner::SaveThroughPanel(const std::string& path, std::string* reason)
{
    std::error_code error;
    const std::filesystem::path absolute = std::filesystem::absolute(path, error);
    if (error || !absolute.has_filename())
        return Fail(reason, "\"" + path + "\" does not name a file");
    if (!std::filesystem::is_directory(absolute.parent_path(), error))
        return Fail(reason, "no such folder: " + absolute.parent_path().string());
    window_->PostMessage(kMsgSaveAs);
    DrainEvents();
    QFileDialog* panel = window_->SavePanel();
    if (panel == nullptr || !panel->isVisible())
        return Fail(reason, "the save panel did not appear");
    panel->hide();
    emit panel->fileSelected(QString::fromStdString(absolute.string()));
    return true;
}

// ---------------------------------------------------------------------------
// Program entry

int BatchRunner::Main(int argc, char** argv)
{
    if (argc != 3) {
        std::fprintf(stderr, "usage: %s --batch SCRIPT   (SCRIPT - reads standard input)\n", argv[0]);
        return kFailed;
    }
    const std::string scriptName = argv[2];
    std::ifstream scriptFile;
    if (scriptName != "-") {
        scriptFile.open(scriptName);
        if (!scriptFile) {
            std::fprintf(stderr, "cannot read the script %s: %s\n", scriptName.c_str(), std::strerror(errno));
            return kFailed;
        }
    }
    std::istream& script = scriptName == "-" ? std::cin : scriptFile;

    // No display is needed: the window is drawn off screen.
    qputenv("QT_QPA_PLATFORM", "offscreen");
    // One device pixel per pixel, whatever scaling the user's desktop asks
    // for, so that snapshots and "view" rectangles agree.
    qputenv("QT_SCALE_FACTOR", "1");
    qunsetenv("QT_SCREEN_SCALE_FACTORS");
    qputenv("QT_ENABLE_HIGHDPI_SCALING", "0");
    gToolkitMessages = qInstallMessageHandler(FilterToolkitMessages);
    QApplication toolkit(argc, argv);
    QApplication::setApplicationName(QStringLiteral("Glimmet"));
    QApplication::setQuitOnLastWindowClosed(false);

    Quillex application;
    // Closing the window from a script must not end the event loop under it.
    application.SetQuitHook([] {});
    QuillexWindow* window = application.NewWindow();
    BatchRunner runner(application, window);
    return runner.Run(script);
}

}  // namespace glimmet
