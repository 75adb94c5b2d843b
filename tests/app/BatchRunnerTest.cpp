#include <gtest/gtest.h>

#include <QCheckBox>
#include <QComboBox>
#include <QFile>
#include <QFileDialog>
#include <QImage>
#include <QProcess>
#include <QTest>

#include <cstdio>
#include <fstream>
#include <sstream>

#include "AppTestSupport.h"
#include "BatchTestSupport.h"
#include "app/BatchRunner.h"
#include "app/DocumentStateReport.h"
#include "app/TextControl.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

namespace glimmet::test {

TEST_F(BatchTest, PrintOfAnEmptyWindowGivesEveryKey)
{
    ASSERT_EQ(Run("print\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(Output(),
        "{\"title\": \"Glimmet\", \"frames\": 0, \"range\": [-1, -1], \"cursor\": 0, \"playmark\": -1, "
        "\"display\": [0, -1], \"slider\": [0, 0], \"playmode\": \"all\", \"loop\": true, "
        "\"transport\": {\"play mode\": 1, \"play\": 0, \"enabled\": true}, \"undo\": null, \"redo\": null, "
        "\"saved\": true, \"channels\": []}\n");
    EXPECT_EQ(Errors(), "");
}

TEST_F(BatchTest, BlankLinesAndCommentsAreSkipped)
{
    ASSERT_EQ(Run("\n   \n# print\n\t# also not a command\nprint\n\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(Lines(Output()).size(), 1u);
}

TEST_F(BatchTest, AnUnknownCommandStopsTheScriptWithItsLineNumber)
{
    EXPECT_EQ(Run("print\n# comment\nbogus 1 2\nprint\n"), BatchRunner::kFailed);
    EXPECT_EQ(Lines(Output()).size(), 1u);
    EXPECT_EQ(Errors(), "line 3: unknown command \"bogus\"\n");
}

TEST_F(BatchTest, AFourCharacterWordThatNoWindowHandlesIsUnknown)
{
    EXPECT_EQ(Run("abcd\n"), BatchRunner::kFailed);
    EXPECT_EQ(Errors(), "line 1: unknown command \"abcd\"\n");
}

TEST_F(BatchTest, BadArgumentsAreReportedAndNothingAfterThemRuns)
{
    const auto file = fixture_.MakeSound("two.wav", 2, 100);
    const std::vector<std::pair<std::string, std::string>> cases = {
        {"range 5", "range takes 2 arguments"},
        {"range a 7", "range takes two frame numbers"},
        {"select 2", "no channel 2 (the document has 2 channels)"},
        {"select -1", "no channel -1 (the document has 2 channels)"},
        {"focus x", "\"x\" is not a channel index"},
        {"mute", "mute takes 1 argument"},
        {"pan 0 up", "pan takes left, middle or right"},
        {"move 0 far", "\"far\" is not a number of frames"},
        {"playmode sometimes", "playmode takes all, range or visible"},
        {"loop maybe", "loop takes on or off"},
        {"wait -5", "wait takes a number of milliseconds from 0 to 3600000"},
        {"size 0 100", "size takes a width and a height from 1 to 16384 pixels"},
        {"open " + Path("missing.wav"), "no such file: " + Path("missing.wav")},
        {"open " + fixture_.Dir().string(), fixture_.Dir().string() + " is a folder"},
        {"append " + Path("missing.wav"), "no such file: " + Path("missing.wav")},
        {"saveas " + Path("no/such/dir/x.wav"), "no such folder: " + Path("no/such/dir")},
        {"fdin now", "fdin takes no arguments"},
        {"print extra", "print takes 0 arguments"},
        {"cursor 1.5", "\"1.5\" is not a frame number"},
    };
    for (const auto& [line, reason] : cases) {
        BatchRunner runner(fixture_.App(), window_, output_, errors_);
        std::string got;
        ASSERT_TRUE(runner.RunLine("open " + file.string(), &got)) << got;
        EXPECT_FALSE(runner.RunLine(line, &got)) << line;
        EXPECT_EQ(got, reason) << line;
    }
    EXPECT_EQ(Run("open " + file.string() + "\nmute 9\nmute 0\n"), BatchRunner::kFailed);
    EXPECT_EQ(Errors(), "line 2: no channel 9 (the document has 2 channels)\n");
    EXPECT_FALSE(window_->Manager()->ChannelAt(0)->IsMuted());
}

TEST_F(BatchTest, OpenReplacesTheChannelsAndAppendAddsThem)
{
    const auto stereo = fixture_.MakeSound("stereo.wav", 2, 300);
    const auto mono = fixture_.MakeSound("mono.wav", 1, 200);
    ASSERT_EQ(Run("open " + stereo.string() + "\nopen " + mono.string() + "\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->CountChannels(), 1);
    EXPECT_EQ(window_->windowTitle(), "Glimmet - mono.wav");
    EXPECT_EQ(window_->FileEntry(), mono);
    ASSERT_EQ(Run("append " + stereo.string() + "\nprint\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->CountChannels(), 3);
    EXPECT_EQ(window_->Manager()->FrameCount(), 300);
    EXPECT_NE(LastState().find("\"frames\": 300"), std::string::npos);
}

TEST_F(BatchTest, RangeIsTypedIntoTheFieldsAndCommitted)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 1000);
    ASSERT_EQ(Run("open " + file.string() + "\nrange 10 500\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->RangeStart(), 10);
    EXPECT_EQ(window_->Manager()->RangeEnd(), 500);
    EXPECT_EQ(window_->RangeStartField()->Text(), "10");
    EXPECT_EQ(window_->RangeEndField()->Text(), "500");
    ASSERT_EQ(Run("range -1 -1\nprint\n"), BatchRunner::kSucceeded);
    EXPECT_NE(LastState().find("\"range\": [-1, -1]"), std::string::npos);
}

TEST_F(BatchTest, SelectMakesExactlyTheNamedChannelsSelected)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 100);
    ASSERT_EQ(Run("open " + file.string() + "\nappend " + file.string() + "\nselect 1 3\n"),
        BatchRunner::kSucceeded);
    ChannelManager* manager = window_->Manager();
    EXPECT_FALSE(manager->ChannelAt(0)->IsSelected());
    EXPECT_TRUE(manager->ChannelAt(1)->IsSelected());
    EXPECT_FALSE(manager->ChannelAt(2)->IsSelected());
    EXPECT_TRUE(manager->ChannelAt(3)->IsSelected());
    ASSERT_EQ(Run("select 0\n"), BatchRunner::kSucceeded);
    EXPECT_TRUE(manager->ChannelAt(0)->IsSelected());
    EXPECT_FALSE(manager->ChannelAt(1)->IsSelected());
    ASSERT_EQ(Run("select\n"), BatchRunner::kSucceeded);
    for (int32_t i = 0; i < 4; ++i)
        EXPECT_FALSE(manager->ChannelAt(i)->IsSelected());
}

TEST_F(BatchTest, FocusAndCursorReachTheViews)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 1000);
    ASSERT_EQ(Run("open " + file.string() + "\nfocus 1\ncursor 321\nprint\n"), BatchRunner::kSucceeded);
    EXPECT_TRUE(window_->ContainerView()->SampleViewAtIndex(1)->IsFocus());
    EXPECT_FALSE(window_->ContainerView()->SampleViewAtIndex(0)->IsFocus());
    EXPECT_EQ(window_->ContainerView()->CursorFrame(), 321);
    const std::string state = LastState();
    EXPECT_NE(state.find("\"cursor\": 321"), std::string::npos);
    EXPECT_NE(state.find("\"focused\": false"), std::string::npos);
    EXPECT_NE(state.find("\"focused\": true"), std::string::npos);
    EXPECT_LT(state.find("\"focused\": false"), state.find("\"focused\": true"));
}

TEST_F(BatchTest, MuteAndPanUseTheChannelMenu)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 100);
    ASSERT_EQ(Run("open " + file.string() + "\nmute 1\npan 0 right\n"), BatchRunner::kSucceeded);
    Channel* left = window_->Manager()->ChannelAt(0);
    Channel* right = window_->Manager()->ChannelAt(1);
    EXPECT_FALSE(left->IsMuted());
    EXPECT_TRUE(right->IsMuted());
    EXPECT_EQ(left->PanPosition(), Channel::kPanRight);
    EXPECT_EQ(window_->ContainerView()->ContextChannel(), 0);
    ASSERT_EQ(Run("mute 1\npan 0 middle\npan 1 left\n"), BatchRunner::kSucceeded);
    EXPECT_FALSE(right->IsMuted());
    EXPECT_EQ(left->PanPosition(), Channel::kPanMiddle);
    EXPECT_EQ(right->PanPosition(), Channel::kPanLeft);
}

TEST_F(BatchTest, MoveIsAnUndoableMoveSample)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 100);
    ASSERT_EQ(Run("open " + file.string() + "\nmove 1 40\nprint\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 40);
    EXPECT_EQ(window_->Manager()->FrameCount(), 140);
    EXPECT_NE(LastState().find("\"undo\": \"Move Sample\""), std::string::npos);
    ASSERT_EQ(Run("undo\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 0);
    ASSERT_EQ(Run("redo\nmove 1 -15\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 25);
    // A move to before the start stops at frame 0.
    ASSERT_EQ(Run("move 1 -1000\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 0);
    ASSERT_EQ(Run("undo\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 25);
}

TEST_F(BatchTest, PlayModeAndLoopSetTheControlRow)
{
    ASSERT_EQ(Run("playmode visible\nloop off\nprint\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->PlayModePopup()->currentIndex(), 2);
    EXPECT_FALSE(window_->LoopBox()->isChecked());
    EXPECT_EQ(window_->MarkedPlayModeIndex(), 2);
    EXPECT_NE(LastState().find("\"playmode\": \"visible\", \"loop\": false"), std::string::npos);
    ASSERT_EQ(Run("loop off\nplaymode range\nprint\n"), BatchRunner::kSucceeded);
    EXPECT_FALSE(window_->LoopBox()->isChecked());
    EXPECT_NE(LastState().find("\"playmode\": \"range\", \"loop\": false"), std::string::npos);
    ASSERT_EQ(Run("loop on\n"), BatchRunner::kSucceeded);
    EXPECT_TRUE(window_->LoopBox()->isChecked());
}

TEST_F(BatchTest, TransformsUndoAndRedoByCode)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 1000);
    const std::string before = Path("before.raw");
    const std::string faded = Path("faded.raw");
    const std::string undone = Path("undone.raw");
    ASSERT_EQ(Run("open " + file.string() + "\nsamples 0 " + before + "\nrange 100 199\nselect 0\nfdot\nsamples 0 "
                  + faded + "\nprint\nundo\nsamples 0 " + undone + "\nprint\nredo\nprint\n"),
        BatchRunner::kSucceeded)
        << Errors();
    const auto original = ReadRaw(before);
    const auto fadedSamples = ReadRaw(faded);
    ASSERT_EQ(original.size(), 1000u);
    ASSERT_EQ(fadedSamples.size(), 1000u);
    for (size_t i = 0; i < 1000; ++i) {
        if (i < 100 || i > 199) {
            EXPECT_EQ(fadedSamples[i], original[i]) << i;
        }
    }
    EXPECT_NE(fadedSamples[199], original[199]);
    EXPECT_EQ(ReadRaw(undone), original);
    const auto states = Lines(Output());
    ASSERT_EQ(states.size(), 3u);
    EXPECT_NE(states[0].find("\"undo\": \"Fade Out\", \"redo\": null, \"saved\": false"), std::string::npos);
    EXPECT_NE(states[1].find("\"undo\": null, \"redo\": \"Fade Out\", \"saved\": true"), std::string::npos);
    EXPECT_NE(states[2].find("\"undo\": \"Fade Out\", \"redo\": null"), std::string::npos);
}

// Every command code the issue lists, each with what it visibly does to a
// stereo document of 1000 frames with frames 100 to 199 of both channels
// selected and channel 1 focused.
TEST_F(BatchTest, EveryListedCodeReachesTheWindow)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 1000);
    const std::string setup = "open " + file.string() + "\nrange 100 199\nselect 0 1\nfocus 1\n";
    struct Case {
        std::string lines;
        std::vector<std::string> expected;
    };
    const std::vector<Case> cases = {
        {"fdin", {"\"undo\": \"Fade In\""}},
        {"fdot", {"\"undo\": \"Fade Out\""}},
        {"maxi", {"\"undo\": \"Maximize\""}},
        {"rvrt", {"\"undo\": \"Revert\""}},
        {"rvph", {"\"undo\": \"Revert Phases\""}},
        // A paste replaces the selected range.
        {"COPY\nPSTE", {"\"frames\": 1000", "\"undo\": \"Paste\""}},
        {"CCUT", {"\"frames\": 900", "\"undo\": \"Remove\""}},
        {"CCUT\nPSTE", {"\"frames\": 1000", "\"undo\": \"Paste\""}},
        {"rmov", {"\"frames\": 900", "\"undo\": \"Remove\""}},
        {"trnc", {"\"frames\": 100", "\"undo\": \"Truncate\""}},
        {"addc", {"\"undo\": \"Add Channel\"", "{\"first\": 0, \"frames\": 0"}},
        {"remc", {"\"undo\": \"Remove Channel\"", "\"channels\": [{\"first\": 0, \"frames\": 1000, "
                                                    "\"muted\": false, \"pan\": -128"}},
        {"fdin\nundo", {"\"undo\": null, \"redo\": \"Fade In\""}},
        {"fdin\nundo\nredo", {"\"undo\": \"Fade In\", \"redo\": null"}},
        {"fdin\nclub", {"\"undo\": null, \"redo\": null"}},
        {"SALL", {"\"range\": [0, 999]"}},
        {"slno", {"\"range\": [-1, -1]", "\"selected\": false"}},
        // At most one frame per column: the 687 columns show at least 688 frames.
        {"zora", {"\"display\": [0, 687]"}},
        {"zora\nshal", {"\"display\": [0, 999]"}},
        {"tstr", {"\"undo\": null"}},
        {"cnpl\nwait 50\nstop\nwait 50", {"\"frames\": 1000"}},
    };
    for (const Case& c : cases) {
        QuillexWindow* window = fixture_.App().NewWindow();
        std::swap(window_, window);
        ASSERT_EQ(Run(setup + c.lines + "\nprint\n"), BatchRunner::kSucceeded) << c.lines << Errors();
        const std::string state = LastState();
        for (const std::string& part : c.expected)
            EXPECT_NE(state.find(part), std::string::npos) << c.lines << " gave " << state;
        std::swap(window_, window);
    }
    // Playing and stopping: the window's own state.
    ASSERT_EQ(Run(setup + "cnpl\n"), BatchRunner::kSucceeded);
    EXPECT_TRUE(window_->IsPlaying());
    ASSERT_EQ(Run("stop\nwait 100\n"), BatchRunner::kSucceeded);
    EXPECT_FALSE(window_->IsPlaying());
}

TEST_F(BatchTest, SamplesWritesLittleEndianSixteenBit)
{
    std::vector<std::vector<int16_t>> channels = {{-32768, -1, 0, 1, 32767, 258}};
    WriteWav(fixture_.Dir() / "edge.wav", channels);
    ASSERT_EQ(Run("open " + Path("edge.wav") + "\nsamples 0 " + Path("edge.raw") + "\n"), BatchRunner::kSucceeded);
    std::ifstream in(Path("edge.raw"), std::ios::binary);
    const std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    EXPECT_EQ(bytes, std::string("\x00\x80\xff\xff\x00\x00\x01\x00\xff\x7f\x02\x01", 12));
}

TEST_F(BatchTest, SaveAsAnswersTheSavePanelAndSaveWritesAgain)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 500);
    const std::string saved = Path("copy.wav");
    ASSERT_EQ(Run("open " + file.string() + "\nSALL\nrvph\nsaveas " + saved + "\nprint\n"), BatchRunner::kSucceeded)
        << Errors();
    EXPECT_EQ(window_->FileEntry(), std::filesystem::path(saved));
    EXPECT_FALSE(window_->SavePanel()->isVisible());
    EXPECT_NE(LastState().find("\"title\": \"Glimmet - copy.wav\""), std::string::npos);
    EXPECT_NE(LastState().find("\"saved\": true"), std::string::npos);
    const auto written = ReadWav(saved);
    ASSERT_EQ(written.size(), 2u);
    ASSERT_EQ(written[0].size(), 500u);
    EXPECT_EQ(written[0][5], int16_t(-105));
    ASSERT_EQ(Run("undo\nsave\nprint\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(ReadWav(saved)[0][5], int16_t(105));
    EXPECT_NE(LastState().find("\"saved\": true"), std::string::npos);
}

TEST_F(BatchTest, SizeFollowsWithTheLayoutAndSnapshotIsTheWholeWindow)
{
    const auto file = fixture_.MakeSound("s.wav", 2, 1000);
    const std::string image = Path("window.png");
    ASSERT_EQ(Run("open " + file.string() + "\nsize 820 460\nrange 200 600\nselect 0 1\nfocus 0\nsnapshot " + image
                  + "\nprint\n"),
        BatchRunner::kSucceeded)
        << Errors();
    EXPECT_EQ(window_->size(), QSize(820, 460));
    QImage grabbed(QString::fromStdString(image));
    ASSERT_FALSE(grabbed.isNull());
    EXPECT_EQ(grabbed.size(), QSize(820, 460));
    // Each "view" rectangle frames exactly what the channel's view draws.
    for (int32_t index = 0; index < 2; ++index) {
        SampleView* view = window_->ContainerView()->SampleViewAtIndex(index);
        const QPoint origin = view->mapTo(window_, QPoint(0, 0));
        const std::string rect = "\"view\": [" + std::to_string(origin.x()) + ", " + std::to_string(origin.y())
            + ", " + std::to_string(view->width()) + ", " + std::to_string(view->height()) + "]";
        EXPECT_NE(LastState().find(rect), std::string::npos) << rect;
        const QImage alone = view->grab().toImage().convertToFormat(QImage::Format_RGB32);
        const QImage part = grabbed.copy(QRect(origin, view->size())).convertToFormat(QImage::Format_RGB32);
        EXPECT_EQ(part, alone) << index;
        EXPECT_GT(view->width(), 700);
    }
}

TEST_F(BatchTest, ClosingAnswersTheQuestionAsTheScriptSaid)
{
    const auto file = fixture_.MakeSound("s.wav", 1, 100);
    ASSERT_EQ(Run("open " + file.string() + "\nSALL\nrvph\n_QRQ\nprint\n"), BatchRunner::kSucceeded);
    // The default answer is the alert's default button: the window stays.
    EXPECT_EQ(fixture_.App().CountWindows(), 1);
    EXPECT_EQ(Run("answer nope\n_QRQ\nprint\n"), BatchRunner::kFailed);
    EXPECT_EQ(Errors(), "line 3: the window is closed\n");
    EXPECT_EQ(fixture_.App().CountWindows(), 0);
    // Not saved: the file still holds the original samples.
    EXPECT_EQ(ReadWav(file)[0][5], int16_t(105));
}

TEST_F(BatchTest, AnsweringYesSavesBeforeClosing)
{
    const auto file = fixture_.MakeSound("s.wav", 1, 100);
    ASSERT_EQ(Run("open " + file.string() + "\nSALL\nrvph\nanswer yes\n_QRQ\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(fixture_.App().CountWindows(), 0);
    EXPECT_EQ(ReadWav(file)[0][5], int16_t(-105));
}

TEST_F(BatchTest, WaitLetsPlaybackRun)
{
    const auto file = fixture_.MakeSound("long.wav", 1, 44100 * 5);
    ASSERT_EQ(Run("open " + file.string() + "\ncnpl\nwait 400\nprint\nstop\nwait 100\n"), BatchRunner::kSucceeded);
    const std::string state = LastState();
    const size_t at = state.find("\"playmark\": ");
    ASSERT_NE(at, std::string::npos);
    EXPECT_GT(std::stoll(state.substr(at + 12)), 0) << state;
    EXPECT_FALSE(window_->IsPlaying());
}

TEST(DocumentStateReport, QuotesLikeJson)
{
    EXPECT_EQ(DocumentStateReport::Quoted("a\"b\\c\n\x01"), "\"a\\\"b\\\\c\\u000a\\u0001\"");
    EXPECT_EQ(DocumentStateReport::Quoted("Glimmet - é.wav"), "\"Glimmet - é.wav\"");
}

// The program itself: no display, the script on standard input, the exit
// status and both output streams.
class BatchProgram : public ::testing::Test {
protected:
    int RunProgram(const QStringList& arguments, const QByteArray& input,
        const std::vector<std::pair<QString, QString>>& extraEnvironment = {})
    {
        const QString program = QCoreApplication::applicationDirPath() + "/../glimmet";
        EXPECT_TRUE(QFile::exists(program)) << program.toStdString();
        QProcess process;
        QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
        environment.remove("DISPLAY");
        environment.remove("WAYLAND_DISPLAY");
        environment.remove("QT_QPA_PLATFORM");
        environment.insert("SDL_AUDIODRIVER", "dummy");
        for (const auto& [name, value] : extraEnvironment)
            environment.insert(name, value);
        process.setProcessEnvironment(environment);
        process.start(program, arguments);
        EXPECT_TRUE(process.waitForStarted(5000));
        process.write(input);
        process.closeWriteChannel();
        EXPECT_TRUE(process.waitForFinished(60000));
        output_ = process.readAllStandardOutput().toStdString();
        errors_ = process.readAllStandardError().toStdString();
        return process.exitStatus() == QProcess::NormalExit ? process.exitCode() : -1;
    }

    std::vector<std::string> JsonLines() const
    {
        std::vector<std::string> json;
        for (const std::string& line : Lines(output_)) {
            if (!line.empty() && line.front() == '{')
                json.push_back(line);
        }
        return json;
    }

    QTemporaryDir dir_;
    std::string output_;
    std::string errors_;
};

TEST_F(BatchProgram, RunsAScriptFromStandardInputWithoutADisplay)
{
    const std::string file = (std::filesystem::path(dir_.path().toStdString()) / "tone.wav").string();
    WriteWav(file, {{1, 2, 3, 4, 5, 6, 7, 8}, {9, 10, 11, 12, 13, 14, 15, 16}});
    EXPECT_EQ(RunProgram({"--batch", "-"}, QByteArray::fromStdString("open " + file + "\nprint\n")), 0)
        << errors_;
    ASSERT_EQ(JsonLines().size(), 1u) << output_;
    EXPECT_NE(JsonLines()[0].find("\"title\": \"Glimmet - tone.wav\", \"frames\": 8"), std::string::npos);
}

TEST_F(BatchProgram, AnErrorExitsWithStatusTwo)
{
    EXPECT_EQ(RunProgram({"--batch", "-"}, "print\n\nrange 1\nprint\n"), 2);
    EXPECT_EQ(JsonLines().size(), 1u) << output_;
    EXPECT_NE(errors_.find("line 3: range takes 2 arguments\n"), std::string::npos) << errors_;
}

TEST_F(BatchProgram, ScriptFileAndMissingScript)
{
    const QString script = dir_.filePath("script.txt");
    QFile file(script);
    ASSERT_TRUE(file.open(QIODevice::WriteOnly));
    file.write("# two states\nprint\naddc\nprint\n");
    file.close();
    EXPECT_EQ(RunProgram({"--batch", script}, ""), 0) << errors_;
    ASSERT_EQ(JsonLines().size(), 2u);
    EXPECT_NE(JsonLines()[1].find("\"undo\": \"Add Channel\""), std::string::npos);

    EXPECT_EQ(RunProgram({"--batch", dir_.filePath("none.txt")}, ""), 2);
    EXPECT_NE(errors_.find("cannot read the script"), std::string::npos) << errors_;
    EXPECT_EQ(RunProgram({"--batch"}, ""), 2);
    EXPECT_NE(errors_.find("usage:"), std::string::npos) << errors_;
}

TEST_F(BatchProgram, SnapshotsHaveOnePixelPerPixelWhateverTheDesktopScale)
{
    const QString image = dir_.filePath("scaled.png");
    EXPECT_EQ(RunProgram({"--batch", "-"}, QByteArray("size 640 300\nsnapshot ") + image.toUtf8() + "\n",
                  {{"QT_SCALE_FACTOR", "2"}, {"QT_SCREEN_SCALE_FACTORS", "3"}}),
        0)
        << errors_;
    EXPECT_EQ(QImage(image).size(), QSize(640, 300));
}

TEST_F(BatchProgram, DiagnosticsStillGoToStandardOutput)
{
    EXPECT_EQ(RunProgram({"--batch", "-"}, "undo\n"), 0) << errors_;
    EXPECT_NE(output_.find("Error doing undo: "), std::string::npos) << output_;
}

}  // namespace glimmet::test
