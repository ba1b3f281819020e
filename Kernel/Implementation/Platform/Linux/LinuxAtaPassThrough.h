// ATA pass-through requests (ATA_PASS_THROUGH_EX with its data buffer) carried out through SG_IO as
// ATA PASS-THROUGH (16) commands of the SCSI/ATA translation.
#pragma once

#include <cstdint>

// Runs the request in (header and data) and writes the answer (header with the returned registers and
// the data read) to out. Returns 0 or a system error code; returned is the answer's byte count.
uint32_t LinuxAtaPassThrough(int fd, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                             uint32_t &returned);
