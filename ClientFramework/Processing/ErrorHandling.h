// The error handling of the run's disk work: how often a failing transfer is tried, which errors are
// passed over and after how many errors an operation stops. The values are the stored ones (the
// settings' "processing" / "error-handling" element), replaced for this run by the command line's
// "retryattempts", "ignoreerrors" and "stopaftererrors".
#pragma once

#include <QDomElement>

#include <cstdint>

namespace Framework::Processing {

struct ErrorHandling
{
    int retries = 2;          // attempts of a failing transfer
    bool ignoreLock = false;  // go on when a volume cannot be locked
    bool ignoreRead = false;  // go on after a failed read
    bool ignoreWrite = false; // go on after a failed write
    int limit = 0;            // stop after this many errors (0: never)

    // The stored values below the settings root (defaults where missing).
    static ErrorHandling stored(const QDomElement &settingsRoot);
    // The stored values of the settings document with the command line's over them.
    static ErrorHandling forThisRun();
    // Puts the options the command line gives in place of these values.
    void applyCommandLine();

    // The attempts the kernel makes of a failing device transfer (at least one).
    std::uint8_t transferAttempts() const;
};

} // namespace Framework::Processing
