#include "views/SampleView.h"

#include <algorithm>
#include <cmath>
#include <system_error>
#include <thread>

#include <QApplication>
#include <QKeyEvent>
#include <QMouseEvent>
#include <QPainter>

#include "sound/Channel.h"
#include "sound/DocumentWindow.h"
#include "support/MessageCodes.h"
#include "support/SystemTime.h"
#include "views/ChannelContainerView.h"
#include "views/PixelCanvas.h"
#include "views/WaveformRenderer.h"

namespace glimmet {

namespace {

constexpr int kMinimumWidth = 10;
constexpr int kMinimumHeight = 15;
constexpr int kMaximumSize = 2000;
// Key repeats closer together than this are not acted on.
constexpr int64_t kKeyGateMicros = 15000;

constexpr int kKeyLeftArrow = 0x1c;
constexpr int kKeyDownArrow = 0x1f;
constexpr int kKeyDelete = 0x7f;

}  // namespace

SampleView::SampleView(Channel* channel, ChannelContainerView* container, QWidget* parent)
    : MessageView(parent), channel_(channel), container_(container), clock_(&system_time),
      summaries_(channel, rowTable_.data())
{
    setObjectName("sample view");
    // Not marked opaque, although the picture covers the whole view: Qt cuts
    // every opaque sibling out of a repaint region one by one, so that a
    // repaint of the whole container would cost the square of the channel
    // count. The container beneath fills the view's area first, which its
    // picture then covers.
    // Focus comes with a click, so that no channel is focused when a window
    // opens.
    setFocusPolicy(Qt::ClickFocus);
    setSizePolicy(QSizePolicy::Expanding, QSizePolicy::Expanding);
    lastMouseDown_ = clock_();
    lastKeyDown_ = lastMouseDown_;
    inLayout_ = true;
    resize(11, 16);
    inLayout_ = false;
    FrameResized(Bounds().Width(), Bounds().Height());
}

SampleView::~SampleView() = default;

ViewRect SampleView::Layout(const ViewRect& frame)
{
    placed_ = true;
    inLayout_ = true;
    PlaceAt(frame);
    inLayout_ = false;
    FrameResized(Frame().Width(), Frame().Height());
    return Frame();
}

void SampleView::resizeEvent(QResizeEvent* event)
{
    MessageView::resizeEvent(event);
    if (!inLayout_ && bitmap_.size() != size())
        FrameResized(Bounds().Width(), Bounds().Height());
}

// A layout that keeps the size keeps the image and its row table: only the
// columns whose frames changed with the layout are rendered again.
void SampleView::FrameResized(float width, float height)
{
    const int columns = PixelCanvas::RoundToPixel(width) + 1;
    const int rows = PixelCanvas::RoundToPixel(height) + 1;
    if (!bitmap_.isNull() && bitmap_.width() == columns && bitmap_.height() == rows) {
        Update(Bounds());
        return;
    }
    drawn_.clear();
    if (columns > 0 && rows > 0)
        bitmap_ = QImage(columns, rows, QImage::Format_RGB32);
    else
        bitmap_ = QImage();
    BuildRowTable(std::max(rows, 1));
    Update();
}

// Row i of the table holds the row of the samples -32768 + 8i .. + 8i + 7.
// q is one more than 65535 / rows, so the largest sample lands in the last
// row at most and the table needs no per-sample division.
void SampleView::BuildRowTable(int32_t rows)
{
    const uint32_t q = 65535u / uint32_t(rows) + 1;
    for (int i = 0; i < kRowTableSize; ++i)
        rowTable_[size_t(i)] = int16_t((8u * uint32_t(i)) / q);
}

int32_t SampleView::RowOf(int16_t sample) const
{
    return rowTable_[size_t((int32_t(sample) + 32768) >> 3)];
}

// What a column shows is known from its frames, its state and the blocks
// it reads (RenderColumns forgets every column when those change), so a
// whole-view update renders only the columns that would come out different:
// a display range set to what it already was, or the views of a document
// that gained channels elsewhere, render nothing.
void SampleView::Update()
{
    Update(Bounds());
}

void SampleView::Update(ViewRect rect)
{
    if (channel_ == nullptr || container_ == nullptr)
        return;
    if (std::isnan(rect.left) || std::isnan(rect.right) || std::isnan(rect.top) || std::isnan(rect.bottom))
        return;
    const ViewRect bounds = Bounds();
    rect.left = std::max(rect.left, bounds.left);
    if (rect.left > bounds.right)
        return;
    rect.top = std::max(rect.top, bounds.top);
    if (rect.top > bounds.bottom)
        return;
    rect.right = std::min(rect.right, bounds.right);
    if (rect.right < bounds.left)
        return;
    rect.bottom = std::min(rect.bottom, bounds.bottom);
    if (rect.bottom < bounds.top)
        return;

    if (!bitmap_.isNull() && !AwaitingLayout())
        NotePending(rect);
    const int left = int(std::floor(rect.left));
    const int top = int(std::floor(rect.top));
    const QRect area(QPoint(left, top), QPoint(int(std::ceil(rect.right)), int(std::ceil(rect.bottom))));
    // Inside its container the repaint is asked of the container, which
    // gathers the areas of many views into one rectangle: Qt would otherwise
    // keep one piece per view and cut each view's share out of all of them.
    if (parentWidget() == container_)
        container_->RepaintArea(area.translated(pos()));
    else
        update(area);
}

void SampleView::RenderColumns(const ViewRect& rect)
{
    const ViewRect bounds = Bounds();
    WaveformScene scene;
    scene.firstFrame = container_->FirstDisplayedFrame();
    scene.lastFrame = container_->LastDisplayedFrame();
    scene.rangeStart = container_->RangeStart();
    scene.rangeEnd = container_->RangeEnd();
    scene.cursorFrame = container_->CursorFrame();
    scene.playmarkFrame = container_->PlaymarkFrame();
    scene.selected = channel_->IsSelected();
    scene.channelFirstFrame = channel_->FirstFrame();
    scene.channelFrameCount = channel_->FrameCount();
    // The channel's blocks as they stand; renders run in the window's
    // thread, as edits do, so the blocks stay while the columns are drawn.
    spans_.clear();
    channel_->ReadSpans(0, scene.channelFrameCount, [this](const SampleSpan& span) { spans_.push_back(span); });
    scene.spans = std::span<const SampleSpan>(spans_);
    scene.framesPerColumn = float(scene.lastFrame - scene.firstFrame + 1) / (bounds.Width() + 1);

    // Any edit makes new blocks or moves the data: the columns drawn from
    // the old ones are all rendered again.
    Source source{{}, scene.channelFrameCount, scene.channelFirstFrame};
    source.pieces.reserve(spans_.size());
    for (const SampleSpan& span : spans_)
        source.pieces.push_back({span.block != nullptr ? span.block->Id() : 0, span.offset, span.count});
    if (source != drawnFrom_) {
        drawn_.clear();
        drawnFrom_ = std::move(source);
    }
    const int32_t rows = int32_t(bounds.Height() + 1);
    // Summaries are made after the picture, so a long channel's first
    // picture costs one reading of its samples and not more.
    wantedSummaries_.clear();
    renderedColumns_ += RenderColumnRun(scene, rows, rect.left, int32_t(rect.right - rect.left + 1));
    if (!wantedSummaries_.empty())
        summaries_.Request(spans_, wantedSummaries_);
}

// The columns RenderColumns would render for rect.
void SampleView::NotePending(const ViewRect& rect)
{
    const int32_t first = int32_t(rect.left);
    const int32_t last = int32_t(rect.left + float(int32_t(rect.right - rect.left + 1) - 1));
    if (last < first)
        return;
    if (pendingLast_ < pendingFirst_) {
        pendingFirst_ = first;
        pendingLast_ = last;
    } else {
        pendingFirst_ = std::min(pendingFirst_, first);
        pendingLast_ = std::max(pendingLast_, last);
    }
}

void SampleView::RenderPending()
{
    if (pendingLast_ < pendingFirst_)
        return;
    ViewRect rect = Bounds();
    rect.left = float(pendingFirst_);
    rect.right = float(pendingLast_);
    pendingFirst_ = 0;
    pendingLast_ = -1;
    if (!bitmap_.isNull() && !AwaitingLayout() && channel_ != nullptr && container_ != nullptr)
        RenderColumns(rect);
}

int64_t SampleView::RenderedColumns()
{
    RenderPending();
    return renderedColumns_;
}

const QImage& SampleView::Bitmap()
{
    RenderPending();
    return bitmap_;
}

bool SampleView::AwaitingLayout() const
{
    return !placed_ && parentWidget() == container_;
}

// The first picture of a long channel reads every sample it shows; the
// right half of the columns is read on a second core meanwhile.
int32_t SampleView::RenderColumnRun(const WaveformScene& scene, int32_t rows, float left, int32_t count)
{
    // Sized here, so that neither half resizes the memo under the other.
    if (drawn_.size() != size_t(bitmap_.width()))
        drawn_.assign(size_t(bitmap_.width()), RenderedColumn{});
    WaveformRenderer first(bitmap_, rowTable_.data(), rows, scene);
    first.DeferSummaries(&wantedSummaries_);
    if (left < 0 || count < 2 || double(count) * scene.framesPerColumn < kFramesWorthASecondThread)
        return first.RenderColumns(left, count, &drawn_);

    // Both renderers take the bitmap's pixels here, on this thread. Then each
    // writes only its own columns and their memo entries, and the blocks
    // both read never change.
    const int32_t firstCount = count / 2;
    WaveformRenderer second(bitmap_, rowTable_.data(), rows, scene);
    std::vector<const SampleBlock*> wantedBySecond;
    second.DeferSummaries(&wantedBySecond);
    int32_t renderedBySecond = 0;
    std::thread helper;
    try {
        helper = std::thread([&] {
            renderedBySecond = second.RenderColumns(left + float(firstCount), count - firstCount, &drawn_);
        });
    } catch (const std::system_error&) {
        return first.RenderColumns(left, count, &drawn_);
    }
    const int32_t rendered = first.RenderColumns(left, firstCount, &drawn_);
    helper.join();
    wantedSummaries_.insert(wantedSummaries_.end(), wantedBySecond.begin(), wantedBySecond.end());
    return rendered + renderedBySecond;
}

bool SampleView::IsFocus() const
{
    return hasFocus();
}

void SampleView::MessageReceived(const Message& message)
{
    if (message.what == kMsgMovingSample)
        Update();
}

void SampleView::paintEvent(QPaintEvent* event)
{
    RenderPending();
    // A view not placed yet draws nothing: the container's background shows
    // where it will be.
    if (!bitmap_.isNull() && !AwaitingLayout()) {
        QPainter painter(this);
        painter.drawImage(event->rect(), bitmap_, event->rect());
    }
    // Tells the container that this redraw is done, so that a channel being
    // moved may ask for the next one.
    if (container_ != nullptr)
        container_->PostMessage(kMsgSampleMoved);
}

void SampleView::mousePressEvent(QMouseEvent* event)
{
    pressHandled_ = true;
    Pressed(event);
}

// On X11 the second press of a double click reaches a widget only as a
// double-click event, so it is taken as the press it is; the timing test
// of Pressed still decides whether it makes a double click. Where a plain
// press came first for the same button press, it was already handled.
void SampleView::mouseDoubleClickEvent(QMouseEvent* event)
{
    event->accept();
    if (pressHandled_)
        return;
    pressHandled_ = true;
    Pressed(event);
}

void SampleView::Pressed(QMouseEvent* event)
{
    setFocus(Qt::MouseFocusReason);
    if (container_ != nullptr)
        container_->update();
    const int64_t now = clock_();
    const int64_t doubleClickMicros = int64_t(QApplication::doubleClickInterval()) * 1000;
    if (container_ != nullptr) {
        if (now - lastMouseDown_ < doubleClickMicros)
            container_->DoubleClicked(this, event->position(), event->button(), event->modifiers());
        else
            container_->Clicked(this, event->position(), event->button(), event->modifiers());
    }
    lastMouseDown_ = now;
}

QPointF SampleView::ToContainer(QPointF point) const
{
    return point + QPointF(pos());
}

// The container follows the pointer while a button is held.
void SampleView::mouseMoveEvent(QMouseEvent* event)
{
    if (container_ != nullptr)
        container_->MouseMoved(ToContainer(event->position()));
}

void SampleView::mouseReleaseEvent(QMouseEvent* event)
{
    pressHandled_ = false;
    if (container_ != nullptr)
        container_->MouseUp(ToContainer(event->position()));
}

int SampleView::KeyByte(const QKeyEvent* event)
{
    switch (event->key()) {
    case Qt::Key_Left:
        return 0x1c;
    case Qt::Key_Right:
        return 0x1d;
    case Qt::Key_Up:
        return 0x1e;
    case Qt::Key_Down:
        return 0x1f;
    case Qt::Key_Delete:
        return kKeyDelete;
    case Qt::Key_Space:
        return ' ';
    default:
        break;
    }
    const QString text = event->text();
    return text.isEmpty() ? 0 : int(text.at(0).unicode());
}

void SampleView::keyPressEvent(QKeyEvent* event)
{
    const int64_t now = clock_();
    if (now - kKeyGateMicros <= lastKeyDown_) {
        QWidget::keyPressEvent(event);
        return;
    }
    const int key = KeyByte(event);
    if (key == 0)
        return;
    DocumentWindow* window = container_ != nullptr ? container_->Window() : nullptr;
    if (key == ' ') {
        if (window != nullptr)
            window->PostMessage(event->modifiers().testFlag(Qt::ShiftModifier) ? kMsgPlayFromCursor : kMsgTogglePlay);
    } else if (key >= kKeyLeftArrow && key <= kKeyDownArrow) {
        // The arrows are swallowed.
    } else if (key == kKeyDelete) {
        if (window != nullptr)
            window->PostMessage(kMsgRemove);
        QWidget::keyPressEvent(event);
    } else {
        QWidget::keyPressEvent(event);
    }
    lastKeyDown_ = now;
}

void SampleView::focusInEvent(QFocusEvent* event)
{
    QWidget::focusInEvent(event);
    if (container_ != nullptr)
        container_->update();
}

void SampleView::focusOutEvent(QFocusEvent* event)
{
    // A popup took the pointer: the release of this press goes elsewhere.
    pressHandled_ = false;
    QWidget::focusOutEvent(event);
    if (container_ != nullptr)
        container_->update();
}

QSize SampleView::minimumSizeHint() const
{
    return {kMinimumWidth, kMinimumHeight};
}

QSize SampleView::sizeHint() const
{
    return {kMaximumSize / 4, 100};
}

}  // namespace glimmet
