// Tags of file-name patterns ("{Date(YYYY-MM-DD)}", "{UniqueID}", ...) and their expansion.
#pragma once

#include <QList>
#include <QString>

#include <optional>

namespace Framework {

// Values of the device and process tags; a tag whose value is not given expands to nothing.
struct TagContext
{
    QString serialNumber;
    QString platformId;
    QString productId;
    QString type;
    QString size;
    QString sectors;
    QString status;
    QString dateStarted;
    QString timeStarted;
    QString timeElapsed;
    QString statusCode;
    QString processType;
    QString processedAs;
    QString range;
    std::optional<int> sequence;
};

namespace NameTags {

struct Tag
{
    QString tag;
    QString description;
    QString example;
};

// Every known tag with its description and example, in the order the tag picker shows them.
const QList<Tag> &table();

// The pattern with every known tag replaced; all date and time tags use one reading of the clock.
QString expand(const QString &pattern, const TagContext *context = nullptr);

// A short unique text: the date and time as "MD-hmm" and one character of a 33-character alphabet
// chosen by a process-wide counter that cycles through the alphabet.
QString uniqueId();

} // namespace NameTags
} // namespace Framework
