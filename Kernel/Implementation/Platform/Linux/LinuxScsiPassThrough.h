// SCSI pass-through requests (SCSI_PASS_THROUGH, buffered and direct) carried out through SG_IO.
#pragma once

#include <cstdint>

// Buffered form: the data lies in the request at DataBufferOffset, the sense at SenseInfoOffset.
// Returns 0 or a system error; returned is the offset of the data plus the count transferred.
uint32_t LinuxScsiPassThrough(int fd, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                              uint32_t &returned);

// Direct form: DataBufferOffset is the address of the caller's data. Returns 0 or a system error;
// returned is the size of the request structure.
uint32_t LinuxScsiPassThroughDirect(int fd, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                                    uint32_t &returned);
