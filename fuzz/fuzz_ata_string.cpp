// Identify-data text fields from arbitrary bytes: no read outside the buffer.
#include <cstddef>
#include <cstdint>

#include "smart/AtaString.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 2)
        return 0;
    unsigned first = data[0], words = data[1];
    (void)Smart::ataString(data + 2, size - 2, first, words);
    return 0;
}
