#include "LinuxAtaPassThrough.h"

#include "../../SystemError.h"
#include "../DeviceControl.h"

#include <QByteArray>

#include <cerrno>
#include <cstring>
#include <scsi/sg.h>
#include <sys/ioctl.h>

using DeviceControl::ATA_PASS_THROUGH_EX;

namespace {

constexpr uint8_t kAtaPassThrough16 = 0x85;
constexpr uint8_t kProtocolNonData = 3;
constexpr uint8_t kProtocolPioIn = 4;
constexpr uint8_t kProtocolPioOut = 5;
constexpr uint32_t kMaxTransfer = 64 * 1024;

} // namespace

uint32_t LinuxAtaPassThrough(int fd, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                             uint32_t &returned)
{
    returned = 0;
    if (!in || inSize < sizeof(ATA_PASS_THROUGH_EX) || !out || outSize < sizeof(ATA_PASS_THROUGH_EX))
        return SystemError::InvalidParameter;
    ATA_PASS_THROUGH_EX request;
    std::memcpy(&request, in, sizeof request);
    const bool dataIn = request.AtaFlags & DeviceControl::ATA_FLAGS_DATA_IN;
    const bool dataOut = request.AtaFlags & DeviceControl::ATA_FLAGS_DATA_OUT;
    const bool ext = request.AtaFlags & DeviceControl::ATA_FLAGS_48BIT_COMMAND;
    const uint32_t length = request.DataTransferLength;
    if (request.Length != sizeof(ATA_PASS_THROUGH_EX) || (dataIn && dataOut) || length > kMaxTransfer ||
        (length % 512) != 0 || ((dataIn || dataOut) && length == 0))
        return SystemError::InvalidParameter;
    const uint64_t offset = request.DataBufferOffset;
    if ((dataIn || dataOut) &&
        (offset < sizeof(ATA_PASS_THROUGH_EX) || offset + length > (dataIn ? outSize : inSize)))
        return SystemError::InvalidParameter;

    QByteArray data(int(length ? length : 1), '\0');
    if (dataOut)
        std::memcpy(data.data(), static_cast<const uint8_t *>(in) + offset, length);

    const uint8_t *cur = request.CurrentTaskFile;
    const uint8_t *prev = request.PreviousTaskFile;
    uint8_t cdb[16] = {};
    cdb[0] = kAtaPassThrough16;
    const uint8_t protocol = dataIn ? kProtocolPioIn : dataOut ? kProtocolPioOut : kProtocolNonData;
    cdb[1] = uint8_t(protocol << 1) | (ext ? 1 : 0);
    // Check condition so the registers come back; length in the sector count field, counted in blocks.
    cdb[2] = 0x20 | ((dataIn || dataOut) ? (0x04 | 0x02) : 0) | (dataIn ? 0x08 : 0);
    cdb[3] = ext ? prev[0] : 0;
    cdb[4] = cur[0];
    cdb[5] = ext ? prev[1] : 0;
    cdb[6] = cur[1];
    cdb[7] = ext ? prev[2] : 0;
    cdb[8] = cur[2];
    cdb[9] = ext ? prev[3] : 0;
    cdb[10] = cur[3];
    cdb[11] = ext ? prev[4] : 0;
    cdb[12] = cur[4];
    cdb[13] = cur[5];
    cdb[14] = cur[6];

    uint8_t sense[32] = {};
    sg_io_hdr_t io;
    std::memset(&io, 0, sizeof io);
    io.interface_id = 'S';
    io.cmd_len = sizeof cdb;
    io.cmdp = cdb;
    io.mx_sb_len = sizeof sense;
    io.sbp = sense;
    io.dxfer_direction = dataIn ? SG_DXFER_FROM_DEV : dataOut ? SG_DXFER_TO_DEV : SG_DXFER_NONE;
    io.dxfer_len = length;
    io.dxferp = length ? data.data() : nullptr;
    io.timeout = (request.TimeOutValue ? request.TimeOutValue : 15) * 1000;
    if (ioctl(fd, SG_IO, &io) != 0)
        return errnoToSystemError(errno);
    if (io.host_status != 0 || (io.driver_status & 0x0F) > 1)
        return SystemError::IoDevice;

    ATA_PASS_THROUGH_EX answer = request;
    // The ATA status return descriptor (type 9) of descriptor-format sense data holds the registers.
    const uint8_t *desc = nullptr;
    if (io.sb_len_wr >= 8 && (sense[0] & 0x7F) == 0x72) {
        const int total = std::min<int>(8 + sense[7], std::min<int>(io.sb_len_wr, int(sizeof sense)));
        for (int i = 8; i + 14 <= total; i += 2 + sense[i + 1]) {
            if (sense[i] == 0x09 && sense[i + 1] >= 12) {
                desc = sense + i;
                break;
            }
            if (sense[i + 1] == 0 && sense[i] != 0x09)
                break;
        }
    }
    if (desc) {
        answer.CurrentTaskFile[0] = desc[3];  // error
        answer.CurrentTaskFile[1] = desc[5];  // sector count
        answer.CurrentTaskFile[2] = desc[7];  // LBA low
        answer.CurrentTaskFile[3] = desc[9];  // LBA mid
        answer.CurrentTaskFile[4] = desc[11]; // LBA high
        answer.CurrentTaskFile[5] = desc[12]; // device
        answer.CurrentTaskFile[6] = desc[13]; // status
        if (ext) {
            answer.PreviousTaskFile[1] = desc[4];
            answer.PreviousTaskFile[2] = desc[6];
            answer.PreviousTaskFile[3] = desc[8];
            answer.PreviousTaskFile[4] = desc[10];
        }
    } else if (io.status == 0) {
        answer.CurrentTaskFile[6] = 0x50; // ready, no error: the translation returned no registers
    } else {
        answer.CurrentTaskFile[6] = 0x51;
    }
    std::memcpy(out, &answer, sizeof answer);
    returned = sizeof answer;
    if (dataIn) {
        std::memcpy(static_cast<uint8_t *>(out) + offset, data.constData(), length);
        returned = uint32_t(offset + length);
    }
    return 0;
}
