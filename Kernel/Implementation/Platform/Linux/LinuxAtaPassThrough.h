// ATA pass-through requests (ATA_PASS_THROUGH_EX with its data buffer) carried out through SG_IO as
// ATA PASS-THROUGH (16) commands of the SCSI/ATA translation.
#pragma once

#include <cstdint>

// One ATA command through SG_IO. Registers [0] features, [1] sector count, [2] LBA low, [3] LBA mid,
// [4] LBA high, [5] device, [6] command; on return [0] error and [6] status, the others as the device
// left them (prev: the high bytes of a 48-bit command). direction: 0 none, 1 in, 2 out; length a multiple
// of 512. Returns 0 or a system error.
uint32_t LinuxAtaCommand(int fd, uint8_t cur[8], uint8_t prev[8], bool ext, int direction, uint8_t *data,
                         uint32_t length, uint32_t timeoutSeconds);

// SMART_GET_VERSION, SMART_RCV_DRIVE_DATA and SMART_SEND_DRIVE_COMMAND answered with ATA commands.
uint32_t LinuxSmartControl(int fd, uint32_t code, const void *in, uint32_t inSize, void *out,
                           uint32_t outSize, uint32_t &returned);

// Runs the request in (header and data) and writes the answer (header with the returned registers and
// the data read) to out. Returns 0 or a system error code; returned is the answer's byte count.
uint32_t LinuxAtaPassThrough(int fd, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                             uint32_t &returned);
