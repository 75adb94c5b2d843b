#include <gtest/gtest.h>

#include <QApplication>
#include <QComboBox>
#include <QDialogButtonBox>
#include <QPushButton>
#include <QTemporaryDir>
#include <QTest>
#include <QLineEdit>
#include <QDir>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <thread>
#include <vector>

#include "files/FileTypeAttribute.h"
#include "files/MediaFile.h"
#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "files/panel/PreviewSound.h"
#include "files/panel/SndFileFilter.h"
#include "files/panel/SndFilePanel.h"

namespace glimmet {
namespace {

namespace fs = std::filesystem;

/// A folder of files for the panel, made with sox where sound is needed.
class PanelFolder {
public:
    PanelFolder()
    {
        root_ = fs::path(dir_.path().toStdString());
        output_ = root_ / "preview-output.raw";
        setenv("SDL_AUDIODRIVER", "disk", 1);
        setenv("SDL_DISKAUDIOFILE", output_.c_str(), 1);
        setenv("SDL_DISKAUDIODELAY", "0", 1);
    }
    ~PanelFolder()
    {
        unsetenv("SDL_AUDIODRIVER");
        unsetenv("SDL_DISKAUDIOFILE");
        unsetenv("SDL_DISKAUDIODELAY");
    }

    fs::path Sound(const std::string& name, double seconds = 0.1)
    {
        const fs::path path = root_ / name;
        const std::string command = "sox -n -r 44100 -c 2 -b 16 '" + path.string() + "' synth "
            + std::to_string(seconds) + " sine 440 sine 660 vol 0.5 2>/dev/null";
        EXPECT_EQ(std::system(command.c_str()), 0) << command;
        return path;
    }
    fs::path Text(const std::string& name, const std::string& text = "not a sound\n")
    {
        const fs::path path = root_ / name;
        std::ofstream(path) << text;
        return path;
    }
    const fs::path& Root() const { return root_; }
    const fs::path& Output() const { return output_; }

private:
    QTemporaryDir dir_;
    fs::path root_;
    fs::path output_;
};

/// Whether this file system keeps user attributes (some test machines'
/// temporary folders do not).
bool KeepsAttributes(const fs::path& file)
{
    SetFileType(file, "audio/x-probe");
    const bool kept = FileType(file) == "audio/x-probe";
    return kept;
}

std::vector<int16_t> DecodedSamples(const fs::path& file)
{
    MediaFile media(file);
    MediaTrack* track = media.TrackAt(0);
    media_format format;
    format.type = B_MEDIA_RAW_AUDIO;
    format.raw_audio = media_raw_audio_format::wildcard;
    format.raw_audio.format = B_AUDIO_SHORT;
    EXPECT_EQ(track->DecodedFormat(&format), B_OK);
    std::vector<int16_t> samples;
    const int16_t* frames = nullptr;
    int64_t count = 0;
    while (track->ReadFramesInPlace(&frames, &count) == B_OK)
        samples.insert(samples.end(), frames, frames + count * format.raw_audio.channel_count);
    return samples;
}

std::vector<int16_t> DiskOutput(const fs::path& file)
{
    std::ifstream in(file, std::ios::binary);
    std::vector<char> bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    std::vector<int16_t> samples(bytes.size() / 2);
    std::memcpy(samples.data(), bytes.data(), samples.size() * 2);
    return samples;
}

bool WaitUntilStopped(PreviewSound* sound)
{
    for (int i = 0; i < 500 && sound->IsPlaying(); i++)
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    return !sound->IsPlaying();
}

TEST(SndFileFilterTest, ListsFoldersAndAudioOnly)
{
    PanelFolder folder;
    const fs::path wav = folder.Sound("tone.wav");
    EXPECT_TRUE(SndFileFilter::Accepts(wav)) << "a WAV without a type attribute is known by its contents";
    EXPECT_FALSE(SndFileFilter::Accepts(folder.Text("notes.txt")));
    EXPECT_FALSE(SndFileFilter::Accepts(folder.Text("blob", std::string("\x01\x02\x03\xff\xfe", 5))))
        << "a file of no known type is hidden";
    fs::create_directory(folder.Root() / "sub");
    EXPECT_TRUE(SndFileFilter::Accepts(folder.Root() / "sub"));
    fs::create_symlink(wav, folder.Root() / "link.wav");
    EXPECT_TRUE(SndFileFilter::Accepts(folder.Root() / "link.wav")) << "links are followed";
    fs::create_symlink(folder.Root() / "gone.wav", folder.Root() / "dangling.wav");
    EXPECT_FALSE(SndFileFilter::Accepts(folder.Root() / "dangling.wav"));
    EXPECT_FALSE(SndFileFilter::Accepts(folder.Root() / "missing.wav"));
}

TEST(SndFileFilterTest, TheTypeAttributeWins)
{
    PanelFolder folder;
    const fs::path wav = folder.Sound("typed.wav");
    if (!KeepsAttributes(wav))
        GTEST_SKIP() << "the temporary folder keeps no user attributes";
    SetFileType(wav, "text/plain");
    EXPECT_FALSE(SndFileFilter::Accepts(wav));
    const fs::path text = folder.Text("typed.txt");
    SetFileType(text, "audio/x-flac");
    EXPECT_TRUE(SndFileFilter::Accepts(text));
    SetFileType(text, "Audio/x-flac");
    EXPECT_FALSE(SndFileFilter::Accepts(text)) << "compared case by case";
    SetFileType(text, "audi");
    EXPECT_FALSE(SndFileFilter::Accepts(text));
}

TEST(SndFilePanelTest, LooksLikeASoundPanel)
{
    SndFilePanel panel;
    panel.show();
    EXPECT_EQ(panel.windowTitle(), "Select A Sound File");
    EXPECT_EQ(panel.labelText(QFileDialog::Accept), "Select");
    QDialogButtonBox* buttons = panel.findChild<QDialogButtonBox*>();
    EXPECT_EQ(buttons->button(QDialogButtonBox::Open)->text(), "Select") << "the default button as shown";
    panel.setDirectory(QDir::tempPath());
    QTest::keyClicks(panel.findChild<QLineEdit*>(QStringLiteral("fileNameEdit")), "/tmp/");
    QTest::keyClick(panel.findChild<QLineEdit*>(QStringLiteral("fileNameEdit")), Qt::Key_Return);
    QApplication::processEvents();
    EXPECT_EQ(buttons->button(QDialogButtonBox::Open)->text(), "Select") << "after moving to another folder";
    EXPECT_EQ(panel.fileMode(), QFileDialog::ExistingFile);
    EXPECT_TRUE(panel.testOption(QFileDialog::DontUseNativeDialog));
    ASSERT_NE(panel.PlayButton(), nullptr);
    EXPECT_EQ(panel.PlayButton()->text(), "Play");
    EXPECT_FALSE(panel.PlayButton()->isEnabled());
    QPushButton* cancel = panel.findChild<QDialogButtonBox*>()->button(QDialogButtonBox::Cancel);
    EXPECT_EQ(panel.PlayButton()->geometry(),
        QRect(QPoint(10, cancel->mapTo(&panel, QPoint(0, 0)).y()), cancel->size()));
    EXPECT_EQ(panel.LabelTimer().interval(), 500);
    QComboBox* types = panel.findChild<QComboBox*>(QStringLiteral("fileTypeCombo"));
    ASSERT_NE(types, nullptr);
    EXPECT_FALSE(types->isVisible());
    // The button follows the bottom left corner.
    panel.resize(panel.width() + 100, panel.height() + 60);
    EXPECT_EQ(panel.PlayButton()->geometry().topLeft(), QPoint(10, cancel->mapTo(&panel, QPoint(0, 0)).y()));
}

TEST(SndFilePanelTest, PreviewPlaysTheFileAndThePlayLabelComesBack)
{
    PanelFolder folder;
    const fs::path wav = folder.Sound("preview.wav", 0.2);
    SndFilePanel panel;
    panel.SelectionChanged(QString::fromStdString(wav.string()));
    ASSERT_NE(panel.Preview(), nullptr);
    ASSERT_EQ(panel.Preview()->InitCheck(), B_OK);
    EXPECT_TRUE(panel.PlayButton()->isEnabled());
    panel.TogglePreview();
    EXPECT_EQ(panel.PlayButton()->text(), "Stop");
    EXPECT_TRUE(panel.LabelTimer().isActive());
    ASSERT_TRUE(WaitUntilStopped(panel.Preview()));
    EXPECT_EQ(panel.PlayButton()->text(), "Stop") << "until the timer looks";
    panel.UpdateLabel();
    EXPECT_EQ(panel.PlayButton()->text(), "Play");
    panel.SelectionChanged(QString());  // closes the device, so the file is complete
    const std::vector<int16_t> expected = DecodedSamples(wav);
    // A paused device writes silence until the preview starts.
    std::vector<int16_t> played = DiskOutput(folder.Output());
    const auto start = std::find_if(played.begin(), played.end(), [](int16_t s) { return s != 0; });
    const auto first = std::find_if(expected.begin(), expected.end(), [](int16_t s) { return s != 0; });
    const ptrdiff_t lead = first - expected.begin();
    ASSERT_GE(start - played.begin(), lead);
    played.erase(played.begin(), start - lead);
    ASSERT_GE(played.size(), expected.size());
    played.resize(expected.size());
    EXPECT_EQ(played, expected);
}

TEST(SndFilePanelTest, PlayTwiceStopsAndAFolderDropsThePreview)
{
    PanelFolder folder;
    setenv("SDL_DISKAUDIODELAY", "40", 1);  // real time, so the preview lasts
    const fs::path wav = folder.Sound("long.wav", 3.0);
    SndFilePanel panel;
    panel.show();
    panel.SelectionChanged(QString::fromStdString(wav.string()));
    panel.TogglePreview();
    EXPECT_TRUE(panel.Preview()->IsPlaying());
    panel.TogglePreview();
    EXPECT_FALSE(panel.Preview()->IsPlaying());
    EXPECT_EQ(panel.PlayButton()->text(), "Play");
    // Hidden while playing: the preview goes on, the label timer stops.
    panel.TogglePreview();
    panel.hide();
    EXPECT_TRUE(panel.Preview()->IsPlaying());
    EXPECT_FALSE(panel.LabelTimer().isActive());
    panel.SelectionChanged(QString::fromStdString(folder.Root().string()));
    EXPECT_EQ(panel.Preview(), nullptr);
    EXPECT_FALSE(panel.PlayButton()->isEnabled());
    EXPECT_EQ(panel.PlayButton()->text(), "Stop") << "a new selection leaves the label as it was";
    // A file that is no sound gets a preview that cannot play.
    panel.SelectionChanged(QString::fromStdString(folder.Text("words.txt").string()));
    ASSERT_NE(panel.Preview(), nullptr);
    EXPECT_NE(panel.Preview()->InitCheck(), B_OK);
    EXPECT_FALSE(panel.PlayButton()->isEnabled());
    QTest::mouseClick(panel.PlayButton(), Qt::LeftButton);
    EXPECT_EQ(panel.PlayButton()->text(), "Stop") << "a disabled button does nothing";
}

}  // namespace
}  // namespace glimmet
