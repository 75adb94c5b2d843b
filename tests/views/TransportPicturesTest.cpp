#include <gtest/gtest.h>

#include <QDir>
#include <QImage>

#include <set>

#include "TransportButtonTestSupport.h"
#include "support/MessageCodes.h"
#include "views/PlayButton.h"
#include "views/PlayModeButton.h"
#include "views/StopButton.h"

namespace glimmet::test {
namespace {

const QStringList& Shipped()
{
    static const QStringList names = {"Playbutton-pushedforplaying", "Playbutton-pushedforpause",
        "Playbutton-playing", "Playbutton-plain", "Playbutton-paused", "Playbutton-disabled", "Stopbutton-plain",
        "Stopbutton-pushed", "Stopbutton-disabled", "ForwardFromBeginning-normal", "ForwardFromBeginning-pushed",
        "ForwardFromBeginning-disabled"};
    return names;
}

TEST(TransportPictures, TheResourcesHoldExactlyTheTwelvePictures)
{
    QStringList present = QDir(TransportButton::PictureFolder()).entryList(QDir::Files);
    QStringList expected = Shipped();
    present.sort();
    expected.sort();
    EXPECT_EQ(present, expected);
}

TEST(TransportPictures, EachIsAsWideAsItsButtonAndTwentyOneHigh)
{
    for (const QString& name : Shipped()) {
        SCOPED_TRACE(name.toStdString());
        const int width = name.startsWith("Playbutton") ? 46 : name.startsWith("Stopbutton") ? 31 : 38;
        const QImage decoded = ResourcePicture(name);
        ASSERT_FALSE(decoded.isNull());
        EXPECT_EQ(decoded.size(), QSize(width, 21));
        // The buttons read them through Qt's TGA plugin; it must see the
        // same pixels.
        EXPECT_EQ(TransportButton::LoadPicture(name).convertToFormat(QImage::Format_RGB32), decoded);
    }
}

TEST(TransportPictures, EveryPictureDiffersFromEveryOther)
{
    for (const QString& first : Shipped()) {
        for (const QString& second : Shipped()) {
            if (first < second) {
                EXPECT_NE(ResourcePicture(first), ResourcePicture(second)) << first.toStdString();
            }
        }
    }
}

// The symbol of each state, looked at where it must be drawn: the middle
// of the face is the stop square's, a pause shows the gap between its bars.
TEST(TransportPictures, TheSymbolsAreWhereTheyBelong)
{
    const QRgb black = qRgb(0, 0, 0);
    EXPECT_EQ(ResourcePicture("Stopbutton-plain").pixel(15, 10), black);
    EXPECT_EQ(ResourcePicture("Playbutton-paused").pixel(22, 10), black);
    EXPECT_NE(ResourcePicture("Playbutton-playing").pixel(22, 10), black);
    EXPECT_EQ(ResourcePicture("Playbutton-playing").pixel(19, 10), black);
    EXPECT_NE(ResourcePicture("Stopbutton-disabled").pixel(15, 10), black);
}

TEST(TransportPictures, NoStateOfTheButtonsAsksForThePlainPlayButton)
{
    RecordingWindow window;
    ButtonHost host;
    auto* playMode = new PlayModeButton("play mode", Message(kMsgTogglePlay), &window, 0, &host);
    auto* play = new PlayButton("play", Message(kMsgPlay), Message(kMsgPlayFromCursor), &window, 0, &host);
    auto* stop = new StopButton("stop", Message(kMsgStop), &window, &host);
    host.Show();
    std::set<QString> asked;
    for (int32_t mode = -1; mode <= 4; ++mode) {
        playMode->SetMode(mode);
        play->SetMode(mode);
        for (const bool pushed : {false, true}) {
            for (TransportButton* button : {static_cast<TransportButton*>(playMode),
                     static_cast<TransportButton*>(play), static_cast<TransportButton*>(stop)}) {
                for (const bool enabled : {true, false}) {
                    button->SetEnabled(true);
                    if (pushed)
                        ButtonMouse{button}.Press(QPoint(2, 2), Qt::MiddleButton);
                    button->SetEnabled(enabled);
                    asked.insert(button->PictureName());
                    if (pushed)
                        ButtonMouse{button}.Release(QPoint(-5, 2), Qt::MiddleButton);
                }
            }
        }
    }
    EXPECT_EQ(asked.count("Playbutton-plain"), 0u);
    for (const QString& name : Shipped()) {
        if (name != "Playbutton-plain") {
            EXPECT_EQ(asked.count(name), 1u) << name.toStdString();
        }
    }
}

}  // namespace
}  // namespace glimmet::test
