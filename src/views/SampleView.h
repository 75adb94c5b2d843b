#pragma once

#include <array>
#include <cstdint>
#include <vector>

#include <QImage>

#include "views/MessageView.h"
#include "views/SummaryBuilder.h"
#include "views/WaveformRenderer.h"

namespace glimmet {

class Channel;
class ChannelContainerView;

/// One channel's waveform inside the channel container. It renders into an
/// off-screen RGB32 image, column by column, as a density picture of the
/// samples under each pixel column, with the range, the edit cursor and the
/// play mark as colourings of whole columns. The horizontal scale is the
/// container's.
///
/// Clicks go to the container; Space, Shift+Space and Delete become 'cnpl',
/// 'pfcr' and 'rmov' for the window; every paint posts a bare 'smmd' to the
/// container (the redraw handshake of channel moves) and a posted 'mvsm'
/// re-renders the whole view.
///
/// GUI thread only. The channel and container are not owned.
class SampleView : public MessageView {
    Q_OBJECT

public:
    /// A render reading at least this many frames (about 95 s of sound, 4 ms
    /// or more of work) is split between two threads. A cursor step or a
    /// range drag reads far less and is not worth starting one.
    static constexpr double kFramesWorthASecondThread = double(int64_t(1) << 22);

    /// Time source in microseconds; system_time() unless a test replaces it.
    using Clock = int64_t (*)();

    SampleView(Channel* channel, ChannelContainerView* container, QWidget* parent = nullptr);
    ~SampleView() override;

    Channel* GetChannel() const { return channel_; }
    ChannelContainerView* Container() const { return container_; }

    /// Places the view in its parent, then rebuilds bitmap and row table and
    /// re-renders, even when the size did not change. Returns Frame().
    ViewRect Layout(const ViewRect& frame);
    /// Rebuilds the bitmap and the row table for the size, then re-renders.
    void FrameResized(float width, float height);

    /// Brings the whole view up to date: for changed data or display range.
    void Update();
    /// Marks the columns of rect (always over the full height) to be brought
    /// up to date and schedules a repaint of it. The columns are rendered
    /// when the view is next painted, or its image or render count read, so
    /// that display ranges passing before the window draws cost nothing. The
    /// image is kept between renders, so only columns whose frames, range,
    /// cursor or play mark state changed since they were last rendered are
    /// rendered again; a change of the channel's data, first frame or of the
    /// view's size renders them all.
    void Update(ViewRect rect);

    /// Columns rendered since the view was made: lets tests see that an
    /// update rendered only what changed. Renders what is pending first.
    int64_t RenderedColumns();
    /// Makes the summaries renders asked for, which otherwise happens while
    /// the window is idle.
    SummaryBuilder& Summaries() { return summaries_; }
    bool IsFocus() const;

    /// The off-screen image: one pixel per view pixel, null when it could not
    /// be made.
    /// Renders what is pending first.
    const QImage& Bitmap();
    /// The pixel row of a sample value.
    int32_t RowOf(int16_t sample) const;

    /// 'mvsm' re-renders the whole view.
    void MessageReceived(const Message& message) override;

    /// Tests replace the clock behind the double-click and key timing.
    void SetClock(Clock clock) { clock_ = clock; }

    QSize minimumSizeHint() const override;
    QSize sizeHint() const override;

protected:
    void paintEvent(QPaintEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseDoubleClickEvent(QMouseEvent* event) override;
    void mouseMoveEvent(QMouseEvent* event) override;
    void mouseReleaseEvent(QMouseEvent* event) override;
    void keyPressEvent(QKeyEvent* event) override;
    void focusInEvent(QFocusEvent* event) override;
    void focusOutEvent(QFocusEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

private:
    static constexpr int kRowTableSize = 8192;

    void BuildRowTable(int32_t rows);
    void RenderColumns(const ViewRect& rect);
    /// Renders count columns from left, on two threads when they read
    /// enough frames to be worth it; returns how many it rendered.
    int32_t RenderColumnRun(const WaveformScene& scene, int32_t rows, float left, int32_t count);
    /// A view its container has made but not placed yet renders nothing:
    /// the layout, already on its way, renders the whole picture at the
    /// size it gives.
    bool AwaitingLayout() const;
    /// Adds the columns rect touches to those waiting for a render.
    void NotePending(const ViewRect& rect);
    /// Renders the columns waiting since the last render.
    void RenderPending();
    /// The key as one character of the original key map (arrows 0x1c to
    /// 0x1f, Delete 0x7f); 0 for a key that produces no character.
    static int KeyByte(const QKeyEvent* event);
    QPointF ToContainer(QPointF point) const;
    /// A press, whichever event brought it: focus, then a click or a
    /// double click by the time since the last press.
    void Pressed(QMouseEvent* event);

    Channel* channel_;
    ChannelContainerView* container_;
    QImage bitmap_;
    int64_t lastMouseDown_;
    int64_t lastKeyDown_;
    std::array<int16_t, kRowTableSize> rowTable_{};
    Clock clock_;
    // What each column of the image shows, and what the whole image was
    // rendered from; a column is rendered again only when either changes.
    std::vector<RenderedColumn> drawn_;
    struct Piece {
        uint64_t block = 0;
        int64_t offset = 0;
        int64_t count = 0;
        bool operator==(const Piece&) const = default;
    };
    struct Source {
        std::vector<Piece> pieces;
        int64_t frameCount = 0;
        int64_t firstFrame = 0;
        bool operator==(const Source&) const = default;
    };
    Source drawnFrom_;
    std::vector<SampleSpan> spans_;  // the last render's, kept for its capacity
    std::vector<const SampleBlock*> wantedSummaries_;
    SummaryBuilder summaries_;
    int64_t renderedColumns_ = 0;
    bool inLayout_ = false;
    // Whether the container has placed the view yet. A view it has only
    // just made still has the size it was made with, and a picture at that
    // size is drawn again at once by the layout.
    bool placed_ = false;
    // Columns waiting for a render, first to last; none when first > last.
    int32_t pendingFirst_ = 0;
    int32_t pendingLast_ = -1;
    // A press was handled and its release has not come yet.
    bool pressHandled_ = false;
};

}  // namespace glimmet
