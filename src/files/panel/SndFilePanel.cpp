#include "files/panel/SndFilePanel.h"

#include <QComboBox>
#include <QDialogButtonBox>
#include <QFileInfo>
#include <QFileSystemModel>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>

#include <filesystem>

#include "files/panel/PreviewSound.h"
#include "files/panel/SndFileFilter.h"

namespace glimmet {

namespace {

// Where the button sits: this far from the panel's left edge.
constexpr int kButtonLeft = 10;
// How often the label is checked after a preview started.
constexpr int kLabelIntervalMs = 500;

}  // namespace

SndFilePanel::SndFilePanel(QWidget* parent) : QFileDialog(parent)
{
    setOption(QFileDialog::DontUseNativeDialog);
    setFileMode(QFileDialog::ExistingFile);
    setAcceptMode(QFileDialog::AcceptOpen);
    setProxyModel(new SndFileFilter(this));
    setLabelText(QFileDialog::Accept, QStringLiteral("Select"));
    setWindowTitle(QStringLiteral("Select A Sound File"));
    HideTypeChoice();

    auto* buttons = findChild<QDialogButtonBox*>();
    if (buttons != nullptr) {
        cancel_ = buttons->button(QDialogButtonBox::Cancel);
        select_ = buttons->button(QDialogButtonBox::Open);
    }
    KeepSelectLabel();
    if (cancel_ != nullptr) {
        play_ = new QPushButton(QStringLiteral("Play"), this);
        play_->setObjectName(QStringLiteral("PlayStop"));
        play_->setEnabled(false);
        play_->setAutoDefault(false);
        connect(play_, &QPushButton::clicked, this, &SndFilePanel::TogglePreview);
    }
    labelTimer_.setInterval(kLabelIntervalMs);
    connect(&labelTimer_, &QTimer::timeout, this, &SndFilePanel::UpdateLabel);
    connect(this, &QFileDialog::currentChanged, this, &SndFilePanel::SelectionChanged);
}

SndFilePanel::~SndFilePanel() = default;

QStringList SndFilePanel::ListedNames() const
{
    QStringList names;
    QAbstractProxyModel* filter = proxyModel();
    auto* files = filter != nullptr ? qobject_cast<QFileSystemModel*>(filter->sourceModel()) : nullptr;
    if (files == nullptr)
        return names;
    const QModelIndex folder = filter->mapFromSource(files->index(directory().absolutePath()));
    for (int row = 0; row < filter->rowCount(folder); row++)
        names << filter->index(row, 0, folder).data().toString();
    names.sort();
    return names;
}

void SndFilePanel::KeepSelectLabel()
{
    // The file dialog relabels its button "Open" whenever a folder name is
    // typed; the panel's button always reads "Select".
    const auto relabel = [this] {
        if (select_ != nullptr)
            select_->setText(QStringLiteral("Select"));
    };
    if (auto* name = findChild<QLineEdit*>(QStringLiteral("fileNameEdit")))
        connect(name, &QLineEdit::textChanged, this, relabel);
    connect(this, &QFileDialog::currentChanged, this, relabel);
    connect(this, &QFileDialog::directoryEntered, this, relabel);
}

void SndFilePanel::HideTypeChoice()
{
    // The filter decides what is listed; a second choice of types beside it
    // would only contradict it.
    if (auto* types = findChild<QComboBox*>(QStringLiteral("fileTypeCombo")))
        types->hide();
    if (auto* label = findChild<QLabel*>(QStringLiteral("fileTypeLabel")))
        label->hide();
}

void SndFilePanel::SelectionChanged(const QString& path)
{
    if (preview_) {
        preview_.reset();
        if (play_ != nullptr)
            play_->setEnabled(false);
    }
    if (path.isEmpty() || QFileInfo(path).isDir())
        return;
    preview_ = std::make_unique<PreviewSound>(std::filesystem::path(path.toStdString()));
    if (play_ != nullptr && preview_->InitCheck() == B_OK)
        play_->setEnabled(true);
}

void SndFilePanel::TogglePreview()
{
    if (!preview_)
        return;
    if (!preview_->IsPlaying()) {
        preview_->StartPlaying();
        play_->setText(QStringLiteral("Stop"));
        if (!labelTimer_.isActive())
            labelTimer_.start();
        return;
    }
    preview_->StopPlaying();
    play_->setText(QStringLiteral("Play"));
}

void SndFilePanel::UpdateLabel()
{
    if (!preview_ || preview_->IsPlaying())
        return;
    if (play_ != nullptr)
        play_->setText(QStringLiteral("Play"));
}

void SndFilePanel::hideEvent(QHideEvent* event)
{
    // The preview plays on; only the label stops following it.
    labelTimer_.stop();
    QFileDialog::hideEvent(event);
}

void SndFilePanel::resizeEvent(QResizeEvent* event)
{
    QFileDialog::resizeEvent(event);
    PlaceButton();
}

void SndFilePanel::showEvent(QShowEvent* event)
{
    QFileDialog::showEvent(event);
    PlaceButton();
}

void SndFilePanel::PlaceButton()
{
    if (play_ == nullptr || cancel_ == nullptr)
        return;
    const QPoint cancelAt = cancel_->mapTo(this, QPoint(0, 0));
    play_->setGeometry(kButtonLeft, cancelAt.y(), cancel_->width(), cancel_->height());
    play_->raise();
}

}  // namespace glimmet
