#pragma once

#include <QObject>
#include <QPointer>
#include <QString>
#include <QTimer>

#include <memory>
#include <optional>
#include <utility>
#include <vector>

#include "app/PointerProbe.h"

class QWidget;

namespace glimmet {

class BubbleWindow;

/// Bubble help for every window of the application: when the pointer has
/// rested for seven polls over a widget that has a help text (or inside
/// such a widget), a bubble with the text appears 20 pixels below the
/// pointer. It goes at once when the pointer moves or a button is pressed,
/// else after one poll per character of the text (at least 20); a bubble
/// shows once per rest.
///
/// There is exactly one helper; a second one is a programming error that
/// ends the program. The helper polls the pointer every 100 ms from a timer
/// in the GUI thread, or, when made with Polling::Manual, only when Poll()
/// is called, which lets tests count polls instead of waiting for them.
class BubbleHelper : public QObject {
    Q_OBJECT

public:
    enum class Polling { Timer, Manual };

    static constexpr int kPollMillis = 100;
    /// The poll in a row with the pointer at rest that asks for a bubble.
    static constexpr int kRestPolls = 7;
    /// The shortest display, in polls; longer texts stay a poll per character.
    static constexpr int kMinDisplayPolls = 20;
    /// How far below the pointer the bubble's top goes.
    static constexpr int kOffsetBelow = 20;
    static constexpr const char* kSecondInstanceMessage = "only one BubbleHelper instance allowed/necessary";

    /// With no probe the helper reads the real desktop.
    explicit BubbleHelper(std::unique_ptr<PointerProbe> probe = nullptr, Polling polling = Polling::Timer);
    ~BubbleHelper() override;
    BubbleHelper(const BubbleHelper&) = delete;
    BubbleHelper& operator=(const BubbleHelper&) = delete;

    /// The helper of this process, or null while there is none.
    static BubbleHelper* Instance();

    /// Gives view a help text, replacing its old one; a null text takes the
    /// view's help away. A null view is ignored.
    void SetHelp(QWidget* view, const QString& text);
    /// Gives view its help text in the process's helper; nothing happens
    /// while there is no helper (a window made without the application).
    static void RegisterHelp(QWidget* view, const char* text);
    /// The view's own text (not its parents'); null when it has none.
    QString GetHelp(const QWidget* view) const;
    /// Switches bubbles on or off for the polls to come. A bubble already on
    /// screen stays until its own time is up.
    void EnableHelp(bool enable) { enabled_ = enable; }
    bool IsEnabled() const { return enabled_; }

    /// The widget under a screen point, never part of the bubble itself.
    QWidget* FindView(QPoint where) const;
    /// The text of the nearest widget, from the one under the point up to its
    /// window, that has help; null when none has.
    QString HelpAt(QPoint where) const;
    /// Shows text in the bubble near the pointer at where.
    void DisplayHelp(const QString& text, QPoint where);
    void ShowBubble(QPoint where);
    void HideBubble();

    /// Where a bubble of the text's width and height goes for the pointer at
    /// where: below it, above it near the bottom edge, pushed left at the
    /// right edge.
    static QPoint BubblePosition(QPoint where, int textWidth, int textHeight, QRect screen);

    /// One poll of the pointer.
    void Poll();

    /// The bubble's window; null until the first bubble is shown.
    BubbleWindow* Bubble() const { return bubble_.get(); }
    bool IsBubbleShown() const;
    /// The poll timer's interval; 0 for a helper polled by hand.
    int PollIntervalMillis() const { return timer_.isActive() ? timer_.interval() : 0; }

private:
    enum class Phase { AwaitingRest, Showing, AwaitingMove };

    void PollForRest();
    void PollWhileShowing();
    void PollForMove();
    /// After a bubble was hidden: wait for the pointer to leave where the
    /// bubble was shown, unless it has already.
    void EndDisplay(QPoint position);
    BubbleWindow& EnsureBubble();

    using HelpEntry = std::pair<QPointer<QWidget>, QString>;

    std::unique_ptr<PointerProbe> probe_;
    std::vector<HelpEntry> helpList_;
    std::unique_ptr<BubbleWindow> bubble_;
    bool enabled_ = false;
    bool counted_ = false;  // whether this helper holds the one instance
    QTimer timer_;

    Phase phase_ = Phase::AwaitingRest;
    std::optional<QPoint> lastPosition_;
    int restPolls_ = 0;
    QPoint shownAt_;
    int displayPolls_ = 0;
    int displayLimit_ = 0;
};

}  // namespace glimmet
