// The number fields of the go-to dialogs: signed 64-bit values in decimal (shown with the locale's
// group separators) or, after a "0x" prefix, in hexadecimal, within a minimum and a maximum.
#pragma once

#include <QValidator>

#include <cstdint>
#include <optional>

namespace HexEditor {

class HexInt64Validator : public QValidator
{
    Q_OBJECT
public:
    HexInt64Validator(int64_t minimum, int64_t maximum, QObject *parent = nullptr);

    int64_t minimum() const { return m_min; }
    int64_t maximum() const { return m_max; }
    void setRange(int64_t minimum, int64_t maximum);

    State validate(QString &input, int &pos) const override;

    // The value of a text as the validator reads it (without range check); none when it is no number.
    std::optional<int64_t> value(const QString &text) const;
    // The value of a text that the validator accepts; none otherwise (an empty field among them).
    std::optional<int64_t> acceptedValue(const QString &text) const;

    static bool isHexadecimal(const QString &text);

private:
    int64_t m_min;
    int64_t m_max;
};

} // namespace HexEditor
