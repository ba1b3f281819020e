#include "Kernel/Implementation/Platform/Linux/LinuxScsiPassThrough.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"

#include <QByteArray>

#include <cerrno>
#include <cstring>
#include <scsi/sg.h>
#include <sys/ioctl.h>

using DeviceControl::SCSI_PASS_THROUGH;

namespace {

constexpr uint32_t kMaxTransfer = 1 << 20;

struct Outcome
{
    uint32_t error = 0;
    uint8_t status = 0;
    uint32_t transferred = 0;
    uint8_t senseLength = 0;
};

Outcome run(int fd, SCSI_PASS_THROUGH &request, void *data, uint8_t *sense)
{
    Outcome outcome;
    sg_io_hdr_t io;
    std::memset(&io, 0, sizeof io);
    io.interface_id = 'S';
    io.cmd_len = request.CdbLength;
    io.cmdp = request.Cdb;
    io.mx_sb_len = request.SenseInfoLength;
    io.sbp = sense;
    io.dxfer_len = request.DataTransferLength;
    io.dxferp = request.DataTransferLength ? data : nullptr;
    io.dxfer_direction = request.DataTransferLength == 0                       ? SG_DXFER_NONE
                         : request.DataIn == DeviceControl::SCSI_IOCTL_DATA_IN ? SG_DXFER_FROM_DEV
                                                                               : SG_DXFER_TO_DEV;
    io.timeout = (request.TimeOutValue ? request.TimeOutValue : 15) * 1000;
    if (ioctl(fd, SG_IO, &io) != 0) {
        outcome.error = errnoToSystemError(errno);
        return outcome;
    }
    if (io.host_status != 0)
        outcome.error = SystemError::IoDevice;
    outcome.status = io.status;
    outcome.senseLength = io.sb_len_wr;
    const int residual = io.resid > 0 ? io.resid : 0;
    outcome.transferred =
        request.DataTransferLength > uint32_t(residual) ? request.DataTransferLength - residual : 0;
    return outcome;
}

bool validHeader(const SCSI_PASS_THROUGH &request)
{
    return request.Length == sizeof(SCSI_PASS_THROUGH) && request.CdbLength >= 6 && request.CdbLength <= 16 &&
           request.SenseInfoLength <= 252 && request.DataIn <= 2 &&
           request.DataTransferLength <= kMaxTransfer;
}

} // namespace

uint32_t LinuxScsiPassThrough(int fd, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                              uint32_t &returned)
{
    returned = 0;
    if (!in || inSize < sizeof(SCSI_PASS_THROUGH) || !out || outSize < sizeof(SCSI_PASS_THROUGH))
        return SystemError::InvalidParameter;
    SCSI_PASS_THROUGH request;
    std::memcpy(&request, in, sizeof request);
    if (!validHeader(request))
        return SystemError::InvalidParameter;
    const uint64_t length = request.DataTransferLength;
    const uint64_t dataOffset = request.DataBufferOffset;
    const uint64_t senseOffset = request.SenseInfoOffset;
    const bool dataIn = request.DataIn == DeviceControl::SCSI_IOCTL_DATA_IN;
    const uint64_t limit = std::min(inSize, outSize);
    if ((length && (dataOffset < sizeof request || dataOffset + length > (dataIn ? outSize : inSize))) ||
        (request.SenseInfoLength &&
         (senseOffset < sizeof request || senseOffset + request.SenseInfoLength > limit)))
        return SystemError::InvalidParameter;

    QByteArray data(int(length ? length : 1), '\0');
    if (length && !dataIn)
        std::memcpy(data.data(), static_cast<const uint8_t *>(in) + dataOffset, size_t(length));
    uint8_t sense[256] = {};
    const Outcome outcome = run(fd, request, data.data(), sense);
    if (outcome.error)
        return outcome.error;

    // The answer is the request with the status, sense and data filled in.
    std::memcpy(out, in, std::min(inSize, outSize));
    auto *answer = static_cast<uint8_t *>(out);
    request.ScsiStatus = outcome.status;
    request.SenseInfoLength = std::min(outcome.senseLength, request.SenseInfoLength);
    if (request.SenseInfoLength)
        std::memcpy(answer + senseOffset, sense, request.SenseInfoLength);
    if (dataIn) {
        request.DataTransferLength = outcome.transferred;
        std::memcpy(answer + dataOffset, data.constData(), outcome.transferred);
        returned = uint32_t(dataOffset + outcome.transferred);
    } else {
        returned = sizeof request;
    }
    std::memcpy(answer, &request, sizeof request);
    return 0;
}

uint32_t LinuxScsiPassThroughDirect(int fd, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                                    uint32_t &returned)
{
    returned = 0;
    if (!in || inSize < sizeof(SCSI_PASS_THROUGH) || !out || outSize < sizeof(SCSI_PASS_THROUGH))
        return SystemError::InvalidParameter;
    SCSI_PASS_THROUGH request;
    std::memcpy(&request, in, sizeof request);
    if (!validHeader(request))
        return SystemError::InvalidParameter;
    void *data = reinterpret_cast<void *>(static_cast<uintptr_t>(request.DataBufferOffset));
    const uint64_t senseOffset = request.SenseInfoOffset;
    if ((request.DataTransferLength && !data) ||
        (request.SenseInfoLength &&
         (senseOffset < sizeof request || senseOffset + request.SenseInfoLength > std::min(inSize, outSize))))
        return SystemError::InvalidParameter;
    uint8_t sense[256] = {};
    const Outcome outcome = run(fd, request, data, sense);
    if (outcome.error)
        return outcome.error;
    std::memcpy(out, in, std::min(inSize, outSize));
    request.ScsiStatus = outcome.status;
    request.SenseInfoLength = std::min(outcome.senseLength, request.SenseInfoLength);
    if (request.SenseInfoLength)
        std::memcpy(static_cast<uint8_t *>(out) + senseOffset, sense, request.SenseInfoLength);
    if (request.DataIn == DeviceControl::SCSI_IOCTL_DATA_IN)
        request.DataTransferLength = outcome.transferred;
    std::memcpy(out, &request, sizeof request);
    returned = sizeof request;
    return 0;
}
