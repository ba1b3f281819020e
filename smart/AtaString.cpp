#include "smart/AtaString.h"

namespace Smart {

QString ataString(const uint8_t *identify, size_t size, unsigned firstWord, unsigned words)
{
    QByteArray text;
    for (unsigned w = firstWord; w < firstWord + words; ++w) {
        size_t at = size_t(w) * 2;
        if (at + 1 >= size)
            break;
        text.append(char(identify[at + 1]));
        text.append(char(identify[at]));
    }
    while (!text.isEmpty() && (text.back() == ' ' || text.back() == '\0'))
        text.chop(1);
    int first = 0;
    while (first < text.size() && (text[first] == ' ' || text[first] == '\0'))
        ++first;
    return QString::fromLatin1(text.mid(first));
}

} // namespace Smart
