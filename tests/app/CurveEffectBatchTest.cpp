#include <gtest/gtest.h>

#include <QImage>

#include <algorithm>
#include <cmath>
#include <regex>
#include <string>
#include <vector>

#include "AppTestSupport.h"
#include "BatchTestSupport.h"
#include "app/DialogInput.h"
#include "app/DialogScriptCommands.h"
#include "edit/EffectReference.h"
#include "edit/dialogs/CurveParameterWindow.h"
#include "edit/effects/Spline.h"
#include "edit/effects/SplineCurve.h"
#include "views/SplineControl.h"

namespace glimmet::test {
namespace {

/// The [x, y] pairs of a `dialog` line's "points".
std::vector<std::pair<double, double>> PointsOf(const std::string& json)
{
    const size_t begin = json.find("\"points\": [");
    const size_t end = json.find("]]", begin);
    std::vector<std::pair<double, double>> points;
    if (begin == std::string::npos || end == std::string::npos)
        return points;
    const std::string list = json.substr(begin, end - begin + 1);
    const std::regex pair(R"(\[([-0-9.e+]+), ([-0-9.e+]+)\])");
    for (auto match = std::sregex_iterator(list.begin(), list.end(), pair); match != std::sregex_iterator(); ++match)
        points.emplace_back(std::stod((*match)[1]), std::stod((*match)[2]));
    return points;
}

/// The curve through the points as the effects evaluate it.
effects::SplineCurve CurveThrough(const std::vector<std::pair<double, double>>& points)
{
    std::vector<double> x;
    std::vector<double> y;
    for (const auto& [px, py] : points) {
        x.push_back(px);
        y.push_back(py);
    }
    return effects::SplineCurve(Spline(x.data(), y.data(), int32_t(x.size())));
}

/// Samples with both signs, runs and extremes, different per channel.
std::vector<std::vector<int16_t>> TestSignal(int frames)
{
    std::vector<std::vector<int16_t>> channels(2, std::vector<int16_t>(size_t(frames)));
    for (int f = 0; f < frames; f++) {
        channels[0][size_t(f)] = int16_t(std::lround(20000.0 * std::sin(f * 0.05)));
        channels[1][size_t(f)] = int16_t(f % 7 == 0 ? -32768 : (f % 11) * 2900 - 14000);
    }
    return channels;
}

/// The causal FIR with its running clamp, on a whole channel from frame 0.
std::vector<int16_t> ReferenceFir(const std::vector<int16_t>& in, const std::vector<double>& kernel)
{
    std::vector<int16_t> out(in.size());
    for (size_t i = 0; i < in.size(); i++) {
        int64_t acc = ReferenceInt32(kernel[0] * in[i]);
        for (size_t k = 1; k < kernel.size(); k++) {
            const double past = i >= k ? in[i - k] : 0.0;
            acc = std::clamp<int64_t>(acc + ReferenceInt32(kernel[k] * past), -32768, 32767);
        }
        out[i] = int16_t(acc);
    }
    return out;
}

class CurveEffectBatchTest : public BatchTest {
protected:
    std::string Open()
    {
        const std::filesystem::path file = fixture_.Dir() / "signal.wav";
        WriteWav(file, signal_);
        return "open " + file.string() + "\nSALL\n";
    }
    std::vector<int16_t> Channel(int index, const std::string& name)
    {
        return ReadRaw(fixture_.Dir() / (name + std::to_string(index) + ".raw"));
    }
    std::string SaveSamples(const std::string& name)
    {
        return "samples 0 " + Path(name + "0.raw") + "\nsamples 1 " + Path(name + "1.raw") + "\n";
    }

    std::vector<std::vector<int16_t>> signal_ = TestSignal(1000);
};

TEST_F(CurveEffectBatchTest, DialogLinesDescribeEachDialog)
{
    ASSERT_EQ(Run("dialog\nfltr\ndialog\ncancel\ndist\ndialog\ncancel\ncomp\ndialog\ncancel\nenlp\ndialog\ncancel\n"
                  "dialog\n"),
        BatchRunner::kSucceeded)
        << Errors();
    const auto lines = Lines(Output());
    ASSERT_EQ(lines.size(), 6u);
    EXPECT_EQ(lines[0], "{\"title\": null}");
    // The end heights are the dialogs' float parameters, stored as floats.
    EXPECT_EQ(lines[1], "{\"title\": \"FIR Filter\", \"points\": [[0, 0.8500000238418579], [1, 1]], \"passes\": 10, "
                        "\"labels\": [\"Filter Function\", \"1.0\"]}");
    EXPECT_EQ(lines[2], "{\"title\": \"Distort\", \"points\": [[0, 1], [1, 0]], \"labels\": [\"Aplitudes\", \"Gain\"]}");
    EXPECT_EQ(lines[3],
        "{\"title\": \"Peak Distort\", \"points\": [[0, 1], [1, 0]], \"labels\": [\"Local Peak\", \"Gain\"]}");
    EXPECT_EQ(lines[4],
        "{\"title\": \"Envelope\", \"points\": [[0, 0.75], [1, 0.75]], \"labels\": [\"Selection\", \"400%\"]}");
    EXPECT_EQ(lines[5], "{\"title\": null}");
}

TEST_F(CurveEffectBatchTest, DialogCommandsWithoutADialogAreBadLines)
{
    for (const char* line : {"ok", "cancel", "close", "curve click 0.5 0.5", "passes 3", "dialogshot /tmp/x.png"}) {
        EXPECT_EQ(Run(std::string(line) + "\n"), BatchRunner::kFailed) << line;
    }
    EXPECT_EQ(Run("fltr\ncurve wiggle 0.5 0.5\n"), BatchRunner::kFailed);
    EXPECT_EQ(Run("fltr\ncurve click 0.5\n"), BatchRunner::kFailed);
    EXPECT_EQ(Run("fltr\ncurve click 0.5 nan\n"), BatchRunner::kFailed);
    EXPECT_EQ(Run("dist\npasses 4\n"), BatchRunner::kFailed);
    EXPECT_NE(Errors().find("no parameter dialog is open"), std::string::npos) << Errors();
}

TEST_F(CurveEffectBatchTest, MouseOnTheCurveAddsDragsAndRemovesPoints)
{
    ASSERT_EQ(Run("fltr\ncurve click 0.5 0.25\ndialog\ncurve drag 0.5 0.25 0.25 0.75\ndialog\n"
                  "curve drag 0 0.85 0.4 0.1\ndialog\ncurve rightclick 0.25 0.75\ndialog\n"
                  "curve rightclick 0 0.1\ndialog\n"),
        BatchRunner::kSucceeded)
        << Errors();
    const auto lines = Lines(Output());
    ASSERT_EQ(lines.size(), 5u);
    const auto added = PointsOf(lines[0]);
    ASSERT_EQ(added.size(), 3u);
    EXPECT_NEAR(added[1].first, 0.5, 0.02);
    EXPECT_NEAR(added[1].second, 0.25, 0.05);
    const auto dragged = PointsOf(lines[1]);
    ASSERT_EQ(dragged.size(), 3u);
    EXPECT_NEAR(dragged[1].first, 0.25, 0.02);
    EXPECT_NEAR(dragged[1].second, 0.75, 0.05);
    // The first point only moves up and down.
    const auto end = PointsOf(lines[2]);
    ASSERT_EQ(end.size(), 3u);
    EXPECT_EQ(end[0].first, 0.0);
    EXPECT_NEAR(end[0].second, 0.1, 0.05);
    EXPECT_EQ(PointsOf(lines[3]).size(), 2u) << lines[3];
    EXPECT_EQ(PointsOf(lines[4]).size(), 2u) << "an end point cannot be removed: " << lines[4];
}

TEST_F(CurveEffectBatchTest, FirFiltersWithTheDrawnCurveAndRedoKeepsTheKernel)
{
    ASSERT_EQ(Run(Open() + "fltr\ncurve click 0.4 0.3\npasses 7.9\ndialog\nok\ndialog\n" + SaveSamples("filtered")
                  + "undo\n" + SaveSamples("undone") + "redo\n" + SaveSamples("redone") + "print\n"),
        BatchRunner::kSucceeded)
        << Errors();
    const auto lines = Lines(Output());
    ASSERT_EQ(lines.size(), 3u);
    EXPECT_NE(lines[0].find("\"passes\": 7.9"), std::string::npos) << lines[0];
    EXPECT_EQ(lines[1], "{\"title\": null}") << "Ok closes the FIR dialog";
    const effects::SplineCurve curve = CurveThrough(PointsOf(lines[0]));
    std::vector<double> kernel;
    for (int i = 0; i < 7; i++)
        kernel.push_back(1.0 - curve(i / 7.0));
    for (int c = 0; c < 2; c++) {
        EXPECT_EQ(Channel(c, "filtered"), ReferenceFir(signal_[size_t(c)], kernel)) << c;
        EXPECT_EQ(Channel(c, "undone"), signal_[size_t(c)]) << c;
        EXPECT_EQ(Channel(c, "redone"), Channel(c, "filtered")) << c;
    }
    EXPECT_NE(lines[2].find("\"undo\": \"FIR Filter\""), std::string::npos);
}

TEST_F(CurveEffectBatchTest, DistortAndEnvelopeKeepTheirDialogHiddenForRedo)
{
    ASSERT_EQ(Run(Open() + "dist\ncurve drag 1 0 1 0.5\nok\ndialog\n" + SaveSamples("distorted") + "undo\n"
                  + SaveSamples("undone") + "redo\n" + SaveSamples("redone")),
        BatchRunner::kSucceeded)
        << Errors();
    EXPECT_EQ(Lines(Output()).front(), "{\"title\": null}");
    for (int c = 0; c < 2; c++) {
        EXPECT_NE(Channel(c, "distorted"), signal_[size_t(c)]);
        EXPECT_EQ(Channel(c, "undone"), signal_[size_t(c)]);
        EXPECT_EQ(Channel(c, "redone"), Channel(c, "distorted"));
    }
}

TEST_F(CurveEffectBatchTest, UntouchedEnvelopeChangesNothingButIsRecorded)
{
    ASSERT_EQ(Run(Open() + "enlp\nok\n" + SaveSamples("enveloped") + "print\n"), BatchRunner::kSucceeded) << Errors();
    for (int c = 0; c < 2; c++)
        EXPECT_EQ(Channel(c, "enveloped"), signal_[size_t(c)]);
    EXPECT_NE(LastState().find("\"undo\": \"Envelope\""), std::string::npos) << LastState();
}

TEST_F(CurveEffectBatchTest, CancelAndTheCloseBoxRecordNothing)
{
    for (const char* answer : {"cancel", "close"}) {
        ASSERT_EQ(Run(Open() + "comp\ncurve click 0.5 0.5\n" + answer + "\ndialog\n" + SaveSamples(answer) + "print\n"),
            BatchRunner::kSucceeded)
            << Errors();
        const auto lines = Lines(Output());
        EXPECT_EQ(lines[lines.size() - 2], "{\"title\": null}") << answer;
        EXPECT_NE(lines.back().find("\"undo\": null"), std::string::npos) << answer << ": " << lines.back();
        for (int c = 0; c < 2; c++)
            EXPECT_EQ(Channel(c, answer), signal_[size_t(c)]) << answer;
    }
}

TEST_F(CurveEffectBatchTest, DialogshotIsTheDialogPixelForPixel)
{
    const std::string shot = Path("dialog.png");
    ASSERT_EQ(Run("enlp\ndialogshot " + shot + "\n"), BatchRunner::kSucceeded) << Errors();
    const QImage image = QImage(QString::fromStdString(shot)).convertToFormat(QImage::Format_RGB32);
    CurveParameterWindow* dialog = DialogScriptCommands::OpenDialog(window_);
    ASSERT_NE(dialog, nullptr);
    EXPECT_EQ(image.size(), dialog->size());
    EXPECT_EQ(image, dialog->grab().toImage().convertToFormat(QImage::Format_RGB32));
    // The white inside of the curve area is in the picture.
    const QPoint inside = dialog->Control()->mapTo(dialog, DialogInput::CurvePixel(*dialog->Control(), 0.5, 0.1));
    EXPECT_EQ(image.pixelColor(inside), QColor(255, 255, 255));
}

}  // namespace
}  // namespace glimmet::test
