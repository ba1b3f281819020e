#include "Kernel/Implementation/Platform/Linux/LinuxAtaPassThrough.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"

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

uint32_t LinuxAtaCommand(int fd, uint8_t cur[8], uint8_t prev[8], bool ext, int direction, uint8_t *data,
                         uint32_t length, uint32_t timeoutSeconds)
{
    const bool dataIn = direction == 1;
    const bool dataOut = direction == 2;
    if (length > kMaxTransfer || (length % 512) != 0 || ((dataIn || dataOut) != (length != 0)))
        return SystemError::InvalidParameter;
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
    io.dxferp = length ? data : nullptr;
    io.timeout = (timeoutSeconds ? timeoutSeconds : 15) * 1000;
    if (ioctl(fd, SG_IO, &io) != 0)
        return errnoToSystemError(errno);
    if (io.host_status != 0 || (io.driver_status & 0x0F) > 1)
        return SystemError::IoDevice;

    // The ATA status return descriptor (type 9) of descriptor-format sense data holds the registers.
    const uint8_t *desc = nullptr;
    if (io.sb_len_wr >= 8 && (sense[0] & 0x7F) == 0x72) {
        const int total = std::min<int>(8 + sense[7], std::min<int>(io.sb_len_wr, int(sizeof sense)));
        for (int i = 8; i + 14 <= total; i += 2 + sense[i + 1]) {
            if (sense[i] == 0x09 && sense[i + 1] >= 12) {
                desc = sense + i;
                break;
            }
        }
    }
    if (desc) {
        cur[0] = desc[3];  // error
        cur[1] = desc[5];  // sector count
        cur[2] = desc[7];  // LBA low
        cur[3] = desc[9];  // LBA mid
        cur[4] = desc[11]; // LBA high
        cur[5] = desc[12]; // device
        cur[6] = desc[13]; // status
        if (ext) {
            prev[1] = desc[4];
            prev[2] = desc[6];
            prev[3] = desc[8];
            prev[4] = desc[10];
        }
    } else {
        // The translation returned no registers: only the outcome is known.
        cur[0] = io.status == 0 ? 0 : 0x04;
        cur[6] = io.status == 0 ? 0x50 : 0x51;
    }
    return 0;
}

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
    ATA_PASS_THROUGH_EX answer = request;
    const uint32_t error = LinuxAtaCommand(fd, answer.CurrentTaskFile, answer.PreviousTaskFile, ext,
                                           dataIn    ? 1
                                           : dataOut ? 2
                                                     : 0,
                                           reinterpret_cast<uint8_t *>(data.data()),
                                           (dataIn || dataOut) ? length : 0, request.TimeOutValue);
    if (error)
        return error;
    std::memcpy(out, &answer, sizeof answer);
    returned = sizeof answer;
    if (dataIn) {
        std::memcpy(static_cast<uint8_t *>(out) + offset, data.constData(), length);
        returned = uint32_t(offset + length);
    }
    return 0;
}

uint32_t LinuxSmartControl(int fd, uint32_t code, const void *in, uint32_t inSize, void *out,
                           uint32_t outSize, uint32_t &returned)
{
    using namespace DeviceControl;
    returned = 0;
    if (code == SMART_GET_VERSION) {
        // Answered only for drives that take ATA commands: a check-power-mode command must go through.
        uint8_t cur[8] = {0, 0, 0, 0, 0, 0xA0, 0xE5, 0}, prev[8] = {};
        if (const uint32_t error = LinuxAtaCommand(fd, cur, prev, false, 0, nullptr, 0, 15))
            return error;
        if (cur[6] & 0x01)
            return SystemError::InvalidFunction;
        GETVERSIONINPARAMS v{};
        v.bVersion = 1;
        v.bRevision = 1;
        v.bIDEDeviceMap = 1;
        v.fCapabilities = 0x7; // ATA identify, ATAPI identify, SMART commands
        if (!out || outSize < sizeof v)
            return SystemError::InsufficientBuffer;
        std::memcpy(out, &v, sizeof v);
        returned = sizeof v;
        return 0;
    }
    if (!in || inSize < sizeof(SENDCMDINPARAMS) || !out || outSize < sizeof(SENDCMDOUTPARAMS))
        return SystemError::InvalidParameter;
    SENDCMDINPARAMS request{};
    std::memcpy(&request, in, std::min<size_t>(inSize, sizeof request));
    const IDEREGS &r = request.irDriveRegs;
    uint8_t cur[8] = {r.bFeaturesReg, r.bSectorCountReg, r.bSectorNumberReg, r.bCylLowReg,
                      r.bCylHighReg,  r.bDriveHeadReg,   r.bCommandReg,      0};
    uint8_t prev[8] = {};
    SENDCMDOUTPARAMS header{};
    auto *answer = static_cast<uint8_t *>(out);
    if (code == SMART_RCV_DRIVE_DATA) {
        if (outSize < sizeof header + 512)
            return SystemError::InsufficientBuffer;
        QByteArray data(512, '\0');
        if (const uint32_t error =
                LinuxAtaCommand(fd, cur, prev, false, 1, reinterpret_cast<uint8_t *>(data.data()), 512, 15))
            return error;
        header.cBufferSize = 512;
        header.bIDEError = cur[0];
        header.bDriverError = (cur[6] & 0x01) ? 1 : 0;
        std::memcpy(answer, &header, sizeof header);
        std::memcpy(answer + sizeof header, data.constData(), 512);
        returned = sizeof header + 512;
        return header.bDriverError ? SystemError::GenFailure : 0;
    }
    if (code == SMART_SEND_DRIVE_COMMAND) {
        if (const uint32_t error = LinuxAtaCommand(fd, cur, prev, false, 0, nullptr, 0, 15))
            return error;
        header.bIDEError = cur[0];
        header.bDriverError = (cur[6] & 0x01) ? 1 : 0;
        IDEREGS back{cur[0], cur[1], cur[2], cur[3], cur[4], cur[5], cur[6], 0};
        returned = sizeof header;
        if (outSize >= sizeof header + sizeof back) {
            header.cBufferSize = sizeof back;
            std::memcpy(answer + sizeof header, &back, sizeof back);
            returned += sizeof back;
        }
        std::memcpy(answer, &header, sizeof header);
        return header.bDriverError ? SystemError::GenFailure : 0;
    }
    return SystemError::InvalidFunction;
}
