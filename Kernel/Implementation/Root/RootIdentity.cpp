#include "Kernel/Implementation/Root/RootIdentity.h"

#include "Kernel/Implementation/Common/ByteOrder.h"

#include <QByteArray>

#include <cstring>

namespace RootIdentity {

namespace {

uint16_t Word(const uint8_t *block, int index)
{
    return ByteOrder::le16(block + index * 2);
}

uint32_t U32(const uint8_t *p)
{
    return ByteOrder::le32(p);
}

// The raw characters of an identify string field in memory order, cut at a zero byte.
QString RawField(const uint8_t *block, int firstWord, int words)
{
    QByteArray bytes(reinterpret_cast<const char *>(block + firstWord * 2), words * 2);
    return QString::fromLatin1(bytes);
}

// A zero-terminated 8-bit text at offset inside the answer (cut at its end when unterminated).
QString AnswerText(const uint8_t *answer, uint32_t returned, uint32_t offset)
{
    if (offset >= returned)
        return {};
    const char *start = reinterpret_cast<const char *>(answer + offset);
    size_t room = returned - offset;
    size_t len = strnlen(start, room);
    return QString::fromLatin1(start, qsizetype(len));
}

// The text of an identify field after the byte-order decision: cut at the first zero, trimmed.
QString FinishField(QString text)
{
    int zero = text.indexOf(QChar(0));
    if (zero >= 0)
        text.truncate(zero);
    return text.trimmed();
}

} // namespace

bool IsSerialCharacter(QChar c)
{
    ushort u = c.unicode();
    return u == ' ' || u == '-' || (u >= '0' && u <= '9') || (u >= 'a' && u <= 'z') || (u >= 'A' && u <= 'Z');
}

QString CutSerial(const QString &text)
{
    qsizetype i = 0;
    while (i < text.size() && IsSerialCharacter(text.at(i)))
        ++i;
    return text.left(i).trimmed();
}

QString CleanSerial(const QString &text)
{
    QString result = text.trimmed();
    bool digits = !text.isEmpty() && text.size() % 2 == 0;
    for (QChar c : text) {
        if (c < QLatin1Char('0') || c > QLatin1Char('9')) {
            digits = false;
            break;
        }
    }
    if (digits) {
        QByteArray packed;
        packed.reserve(text.size() / 2);
        for (qsizetype i = 0; i + 1 < text.size(); i += 2) {
            int high = text.at(i).unicode() - '0';
            int low = text.at(i + 1).unicode() - '0';
            packed.append(char((high << 4) | low));
        }
        result = QString::fromLatin1(packed).trimmed();
    }
    return CutSerial(result);
}

bool ModelInReadingOrder(const QString &rawModel)
{
    QString model = rawModel.trimmed().toUpper();
    static const char *const vendors[] = {"KING", "WDC ", "HITA", "SAMS", "MAXT",
                                          "TOSH", "FUJI", "SPCC", "GOOD"};
    for (const char *v : vendors) {
        if (model.contains(QLatin1String(v)))
            return true;
    }
    return model.size() >= 4 && model.contains(QLatin1String("ST")) && model.at(2).isDigit() &&
           model.at(3).isDigit() && model.at(2).unicode() < 128 && model.at(3).unicode() < 128;
}

QString SwapPairs(const QString &text)
{
    QString out = text;
    for (qsizetype i = 0; i + 1 < out.size(); i += 2) {
        QChar c = out[i];
        out[i] = out[i + 1];
        out[i + 1] = c;
    }
    return out;
}

IdentifyStrings ParseIdentify(const uint8_t *block512)
{
    IdentifyStrings s;
    if (!block512)
        return s;
    uint16_t rpm = Word(block512, 217);
    if (rpm == 1)
        s.rotation = 0;
    else if (rpm >= 1025 && rpm <= 65534)
        s.rotation = rpm;
    if (Word(block512, 1) == 0 || Word(block512, 3) == 0 || Word(block512, 6) == 0)
        return s;
    s.valid = true;
    QString model = RawField(block512, 27, 20);
    QString firmware = RawField(block512, 23, 4);
    QString serial = RawField(block512, 10, 10);
    if (!ModelInReadingOrder(FinishField(model))) {
        model = SwapPairs(model);
        firmware = SwapPairs(firmware);
        serial = SwapPairs(serial);
    }
    s.model = FinishField(model.left(40));
    s.firmware = FinishField(firmware.left(8));
    s.serial = FinishField(serial.left(20));
    return s;
}

bool IsNonZero(const uint8_t *block, uint32_t size)
{
    for (uint32_t i = 0; i < size; ++i) {
        if (block[i])
            return true;
    }
    return false;
}

DescriptorStrings ParseDeviceDescriptor(const uint8_t *answer, uint32_t returned)
{
    DescriptorStrings d;
    if (!answer || returned < 41)
        return d;
    d.valid = true;
    uint32_t serialOffset = U32(answer + 24);
    if (serialOffset >= 40 && serialOffset < returned) {
        if (answer[serialOffset] >= 32) {
            d.serial = CleanSerial(AnswerText(answer, returned, serialOffset));
        } else {
            // A UTF-16 serial: its code units start at the next byte.
            QString wide;
            for (uint32_t p = serialOffset + 1; p + 1 < returned; p += 2) {
                char16_t unit = char16_t(answer[p] | (answer[p + 1] << 8));
                if (unit == 0)
                    break;
                wide.append(QChar(unit));
            }
            d.serial = CutSerial(wide);
        }
    }
    uint32_t vendorOffset = U32(answer + 12);
    uint32_t productOffset = U32(answer + 16);
    uint32_t revisionOffset = U32(answer + 20);
    QString model;
    if (vendorOffset >= 40)
        model = AnswerText(answer, returned, vendorOffset).trimmed();
    if (productOffset >= 40) {
        QString product = AnswerText(answer, returned, productOffset).trimmed();
        if (!model.isEmpty() && !product.isEmpty())
            model += QLatin1Char(' ');
        model += product;
    }
    d.model = model.trimmed();
    if (revisionOffset >= 40)
        d.firmware = AnswerText(answer, returned, revisionOffset).trimmed();
    return d;
}

QString ManagementSerial(const QString &text)
{
    QString cut = text;
    for (qsizetype i = 0; i < cut.size(); ++i) {
        if (cut.at(i).unicode() > 0xFF) {
            cut.truncate(i);
            break;
        }
    }
    if (!cut.isEmpty() && cut.at(0).unicode() > ' ')
        return CleanSerial(cut);
    return cut.trimmed();
}

void MatchSwappedSerial(const QString &identifySerial, QString &controlSerial, QString &managementSerial)
{
    if (identifySerial.isEmpty())
        return;
    QString padded = identifySerial;
    if (padded.size() % 2)
        padded.append(QLatin1Char(' '));
    QString swapped = SwapPairs(padded);
    if (controlSerial == swapped)
        controlSerial = swapped.trimmed();
    if (managementSerial == swapped)
        managementSerial = swapped.trimmed();
}

int SectorShift(uint32_t bytes)
{
    for (int shift = 9; shift <= 12; ++shift) {
        if (bytes == (1u << shift))
            return shift;
    }
    return -1;
}

} // namespace RootIdentity
