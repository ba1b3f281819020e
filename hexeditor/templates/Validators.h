// The validators of the template field editors.
#pragma once

#include <QValidator>

#include <cstdint>

namespace HexEditor::Templates {

// A number in decimal, or hexadecimal after "0x"; group separators and blanks are ignored.
class HexUInt64Validator : public QValidator
{
    Q_OBJECT
public:
    HexUInt64Validator(std::uint64_t minimum, std::uint64_t maximum, QObject *parent = nullptr);
    State validate(QString &input, int &pos) const override;

private:
    std::uint64_t m_min, m_max;
};

// "YYYY-MM-DD" or "YYYY-MM-DD hh:mm:ss" with per-part limits; blank parts are still being typed.
class HexTimeValidator : public QValidator
{
    Q_OBJECT
public:
    HexTimeValidator(bool dateOnly, int minYear, int maxYear, int maxSecond, QObject *parent = nullptr);
    State validate(QString &input, int &pos) const override;

private:
    bool m_dateOnly;
    int m_minYear, m_maxYear, m_maxSecond;
};

class HexDosTimeValidator : public HexTimeValidator
{
    Q_OBJECT
public:
    explicit HexDosTimeValidator(bool dateOnly, QObject *parent = nullptr)
        : HexTimeValidator(dateOnly, 1980, 2107, 58, parent)
    {
    }
};

class HexWindowsTimeValidator : public HexTimeValidator
{
    Q_OBJECT
public:
    explicit HexWindowsTimeValidator(QObject *parent = nullptr)
        : HexTimeValidator(false, 1601, 30827, 59, parent)
    {
    }
};

class HexUnixTimeValidator : public HexTimeValidator
{
    Q_OBJECT
public:
    explicit HexUnixTimeValidator(QObject *parent = nullptr) : HexTimeValidator(false, 1970, 2040, 59, parent)
    {
    }
};

class HexMacTimeValidator : public HexTimeValidator
{
    Q_OBJECT
public:
    explicit HexMacTimeValidator(QObject *parent = nullptr) : HexTimeValidator(false, 1904, 2040, 59, parent)
    {
    }
};

// Short (8.3) names: letters, digits, characters above 127 and $%'-_@~`!(){}^#&.
class HexDosFileNameValidator : public QValidator
{
    Q_OBJECT
public:
    explicit HexDosFileNameValidator(int maxLength, QObject *parent = nullptr);
    State validate(QString &input, int &pos) const override;

protected:
    virtual bool allowed(QChar c) const;
    int m_maxLength;
    bool m_emptyAcceptable = false;
};

// Long names: the short-name characters and +,;=[] and the blank; the empty name is acceptable.
class HexLongFileNameValidator : public HexDosFileNameValidator
{
    Q_OBJECT
public:
    explicit HexLongFileNameValidator(int maxLength, QObject *parent = nullptr);

protected:
    bool allowed(QChar c) const override;
};

// exFAT names: no control characters and none of "*/:<>?\|.
class HexExFatFileNameValidator : public QValidator
{
    Q_OBJECT
public:
    explicit HexExFatFileNameValidator(int maxLength, QObject *parent = nullptr);
    State validate(QString &input, int &pos) const override;

private:
    int m_maxLength;
};

// Hex digit pairs of at most maxBytes bytes, rewritten as upper-case pairs separated by blanks.
class HexPatternValidator : public QValidator
{
    Q_OBJECT
public:
    explicit HexPatternValidator(int maxBytes, QObject *parent = nullptr);
    State validate(QString &input, int &pos) const override;

private:
    int m_maxBytes;
};

} // namespace HexEditor::Templates
