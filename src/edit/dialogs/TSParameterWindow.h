#pragma once

#include <QString>

#include <array>
#include <cstdint>

#include "edit/StretchDialog.h"
#include "edit/dialogs/ParameterDialog.h"

class QLineEdit;

namespace glimmet {

/// "Time Stretch": seven labelled text fields for the phase vocoder's
/// parameters above "Cancel" and the default "Ok". Modal for its document
/// window only, so other windows keep working; it can be made wider but not
/// taller.
class TSParameterWindow : public ParameterDialog {
    Q_OBJECT

public:
    static constexpr int kFieldCount = 7;

    /// parent is the document window; target receives the answers (not
    /// owned, outlives the dialog).
    TSParameterWindow(QWidget* parent, MessageTarget* target);
    ~TSParameterWindow() override;

    /// The texts parsed in the order of the fields, as the C library's
    /// strtol (base 10) and strtod read them whatever the user's locale:
    /// leading blanks are skipped, reading stops at the first character
    /// that does not fit, and a text without a number reads 0.
    void GetParameters(int32_t* fftLength, int32_t* windowSize, int32_t* decimation, int32_t* interpolation,
        float* stretch, float* pitch, float* gate) const;
    StretchParameters Parameters() const;

    /// The labels, in order.
    static const std::array<QString, kFieldCount>& Labels();
    QLineEdit* Field(int index) const { return fields_[size_t(index)]; }
    /// The field labelled label, or null.
    QLineEdit* FieldLabelled(const QString& label) const;
    /// Brings the dialog up at its place on the screen, as large as its
    /// contents need and no taller.
    void ShowAtHome();

    static int32_t ParseInteger(const QString& text);
    static float ParseFloat(const QString& text);

private:
    std::array<QLineEdit*, kFieldCount> fields_{};
};

}  // namespace glimmet
