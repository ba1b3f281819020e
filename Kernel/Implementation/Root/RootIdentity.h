// The identity texts of a drive: serial cleaning, the byte order of ATA identify strings, and the
// parsing of the identify block and of the storage device descriptor. Every offset read from an
// answer is checked against the answer's length.
#pragma once

#include <QString>

#include <cstdint>

namespace RootIdentity {

// The characters a serial keeps: space, '-', digits and ASCII letters.
bool IsSerialCharacter(QChar c);
// Cuts the text before the first character outside the serial set and trims it.
QString CutSerial(const QString &text);
// Cleans a serial text: trimmed; a text of an even number of decimal digits only is packed two
// digits a byte (first digit in the high nibble) and the packed text, trimmed, replaces it; the
// result is cut at the first character outside the serial set and trimmed.
QString CleanSerial(const QString &text);

// True when an identify model is already in reading order (it names a vendor that some bridges
// deliver unswapped, or has the "ST" pattern of a model number with digits in places 3 and 4).
bool ModelInReadingOrder(const QString &rawModel);
// Swaps the characters of each pair ("BADC" -> "ABCD"); an odd last character stays.
QString SwapPairs(const QString &text);

// Texts and rotation taken from a 512-byte identify block.
struct IdentifyStrings
{
    bool valid = false;    // words 1, 3 and 6 are all non-zero
    QString model;         // words 27..46
    QString firmware;      // words 23..26
    QString serial;        // words 10..19
    int32_t rotation = -1; // word 217: 0 solid state, 1025..65534 rpm, else -1
};
IdentifyStrings ParseIdentify(const uint8_t *block512);
// True when the block holds anything but zeros.
bool IsNonZero(const uint8_t *block, uint32_t size);

// Texts of a storage device descriptor (the storage property query's answer).
struct DescriptorStrings
{
    bool valid = false; // at least 41 bytes came back
    QString model;      // vendor and product
    QString firmware;   // product revision
    QString serial;     // the device-control serial
};
DescriptorStrings ParseDeviceDescriptor(const uint8_t *answer, uint32_t returned);

// The management serial as the system's device database gives it: cut at the first character
// above 0xFF and cleaned when its first character is above a space.
QString ManagementSerial(const QString &text);

// Where the identify-data serial, padded to even length and swapped in pairs, equals another
// serial, that serial is replaced by the swapped text trimmed.
void MatchSwappedSerial(const QString &identifySerial, QString &controlSerial, QString &managementSerial);

// log2 of a sector size that is a power of two from 512 to 4096; -1 otherwise.
int SectorShift(uint32_t bytes);

} // namespace RootIdentity
