#include "edit/dialogs/TSParameterWindow.h"

#include <QFormLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QVBoxLayout>

#include <clocale>
#include <cstdlib>
#include <locale.h>

namespace glimmet {

namespace {

const std::array<const char*, TSParameterWindow::kFieldCount> kInitialTexts{
    "8192", "8192", "2048", "2048", "2.0", "0.0", "0.0"};

// Numbers are read with a decimal point whatever the user's locale says: the
// dialog shows "2.0", and a comma locale would otherwise read it as 2.
locale_t CLocale()
{
    static const locale_t c = newlocale(LC_ALL_MASK, "C", locale_t(nullptr));
    return c;
}

}  // namespace

TSParameterWindow::TSParameterWindow(QWidget* parent, MessageTarget* target)
    : ParameterDialog(parent, target, QStringLiteral("Time Stretch"))
{
    auto* form = new QFormLayout;
    for (int i = 0; i < kFieldCount; i++) {
        fields_[size_t(i)] = new QLineEdit(QString::fromLatin1(kInitialTexts[size_t(i)]), this);
        auto* label = new QLabel(Labels()[size_t(i)], this);
        label->setBuddy(fields_[size_t(i)]);
        form->addRow(label, fields_[size_t(i)]);
    }
    auto* column = new QVBoxLayout(this);
    column->setContentsMargins(5, 5, 5, 5);
    column->addLayout(form);
    column->addLayout(ButtonRow());
}

TSParameterWindow::~TSParameterWindow() = default;

const std::array<QString, TSParameterWindow::kFieldCount>& TSParameterWindow::Labels()
{
    static const std::array<QString, kFieldCount> labels{QStringLiteral("FFT length:"),
        QStringLiteral("Window size in samples:"), QStringLiteral("Decimation factor in samples:"),
        QStringLiteral("Interpolation factor in samples:"), QStringLiteral("Stretch factor:"),
        QStringLiteral("Oscillator bank pitch factor:"), QStringLiteral("Oscillator resynthesis gate threshold:")};
    return labels;
}

QLineEdit* TSParameterWindow::FieldLabelled(const QString& label) const
{
    for (int i = 0; i < kFieldCount; i++) {
        if (Labels()[size_t(i)] == label)
            return fields_[size_t(i)];
    }
    return nullptr;
}

int32_t TSParameterWindow::ParseInteger(const QString& text)
{
    const QByteArray bytes = text.toUtf8();
    // strtol's long narrowed to 32 bits, as an int32 takes it.
    return int32_t(strtol_l(bytes.constData(), nullptr, 10, CLocale()));
}

float TSParameterWindow::ParseFloat(const QString& text)
{
    const QByteArray bytes = text.toUtf8();
    return float(strtod_l(bytes.constData(), nullptr, CLocale()));
}

void TSParameterWindow::GetParameters(int32_t* fftLength, int32_t* windowSize, int32_t* decimation,
    int32_t* interpolation, float* stretch, float* pitch, float* gate) const
{
    *fftLength = ParseInteger(fields_[0]->text());
    *windowSize = ParseInteger(fields_[1]->text());
    *decimation = ParseInteger(fields_[2]->text());
    *interpolation = ParseInteger(fields_[3]->text());
    *stretch = ParseFloat(fields_[4]->text());
    *pitch = ParseFloat(fields_[5]->text());
    *gate = ParseFloat(fields_[6]->text());
}

StretchParameters TSParameterWindow::Parameters() const
{
    StretchParameters p;
    GetParameters(&p.fftLength, &p.windowSize, &p.decimation, &p.interpolation, &p.stretch, &p.pitch, &p.gate);
    return p;
}

void TSParameterWindow::ShowAtHome()
{
    ParameterDialog::ShowAtHome();
    setFixedHeight(height());
}

}  // namespace glimmet
