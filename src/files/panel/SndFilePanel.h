#pragma once

#include <QFileDialog>
#include <QPointer>
#include <QTimer>

#include <memory>

class QPushButton;

namespace glimmet {

class PreviewSound;

/// The application's open panel: folders and sound files only, one file at
/// a time, "Select" to open it, and a "Play" button at the bottom left that
/// lets the selected file be heard first.
///
/// The preview belongs to the panel: a new selection drops it, hiding the
/// panel does not (a preview plays on). While a preview plays the button
/// reads "Stop"; a timer puts "Play" back within half a second after a
/// preview has ended by itself.
class SndFilePanel : public QFileDialog {
    Q_OBJECT

public:
    explicit SndFilePanel(QWidget* parent = nullptr);
    ~SndFilePanel() override;

    QPushButton* PlayButton() const { return play_; }
    PreviewSound* Preview() const { return preview_.get(); }
    QTimer& LabelTimer() { return labelTimer_; }
    /// The names the panel lists in its folder now, in its order (the
    /// folder is read in the background, so this fills in after a change).
    QStringList ListedNames() const;

    /// What a change of the selected file does: drops the preview and, for
    /// a file, makes a new one (the button enabled when it can play).
    void SelectionChanged(const QString& path);
    /// The "Play"/"Stop" button.
    void TogglePreview();
    /// The label timer: "Play" again once the preview has stopped.
    void UpdateLabel();

protected:
    void hideEvent(QHideEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    void showEvent(QShowEvent* event) override;

private:
    void HideTypeChoice();
    void KeepSelectLabel();
    /// Keeps the button level with "Cancel", 10 pixels from the left edge.
    void PlaceButton();

    QPushButton* play_ = nullptr;
    QPointer<QPushButton> cancel_;
    QPointer<QPushButton> select_;
    std::unique_ptr<PreviewSound> preview_;
    QTimer labelTimer_;
};

}  // namespace glimmet
