// The device's ATA conversation: identify data, native sizes behind a host-protected area
// and a device configuration overlay, and the two commands that change them.
#include "Kernel/Implementation/Devices/Device.h"

#include <cstring>

#include "Kernel/Implementation/Ata/AtaCommand.h"
#include "Kernel/Implementation/Ata/AtaIdentify.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

bool CDevice::RunAta(const Ata::Command &command, std::uint8_t *data, std::uint64_t *address)
{
    CPlatformFile *handle = m_info.handle;
    if (!handle)
        return false;
    const Ata::Request request =
        Ata::BuildRequest(command, command.direction == Ata::Direction::Out ? data : nullptr);
    Ata::Request answer = request;
    std::uint32_t returned = 0;
    if (!handle->DIOC(Ata::IoctlAtaPassThrough, request.data(), Ata::RequestSize, answer.data(),
                      Ata::RequestSize, &returned))
        return false;
    std::uint64_t lba = 0;
    if (!Ata::CheckReply(answer.data(), returned, command.ext48, lba))
        return false;
    if (command.direction == Ata::Direction::In && data) {
        // A data-in command that came back without its data has nothing to give.
        if (returned != Ata::RequestSize)
            return false;
        std::memcpy(data, answer.data() + Ata::HeaderSize, Ata::DataSize);
    }
    if (address)
        *address = lba;
    return true;
}

bool CDevice::ReadIdentify(std::uint8_t *buffer512)
{
    std::memset(buffer512, 0, AtaIdentify::Size);
    if (!m_info.handle)
        return false;
    for (std::uint8_t code : {Ata::Code::IdentifyDevice, Ata::Code::IdentifyPacketDevice}) {
        Ata::Command c;
        c.command = code;
        c.direction = Ata::Direction::In;
        if (RunAta(c, buffer512, nullptr) && !AtaIdentify::AllZero(buffer512, AtaIdentify::Size))
            return true;
        std::memset(buffer512, 0, AtaIdentify::Size);
    }
    // Drives behind other buses: the SCSI ATA information page carries the same identify data.
    std::vector<std::uint8_t> request = AtaIdentify::BuildAtaInfoInquiry();
    std::vector<std::uint8_t> answer = request;
    std::uint32_t returned = 0;
    if (m_info.handle->DIOC(AtaIdentify::ScsiPassThroughCode, request.data(), std::uint32_t(request.size()),
                            answer.data(), std::uint32_t(answer.size()), &returned) &&
        AtaIdentify::ParseAtaInfoReply(answer.data(), returned, buffer512) &&
        !AtaIdentify::AllZero(buffer512, AtaIdentify::Size))
        return true;
    std::memset(buffer512, 0, AtaIdentify::Size);
    return false;
}

bool CDevice::ReadHpaNative(bool uses48, std::uint64_t &native)
{
    native = 0;
    Ata::Command c;
    c.command = uses48 ? Ata::Code::ReadNativeMaxAddressExt : Ata::Code::ReadNativeMaxAddress;
    c.ext48 = uses48;
    std::uint64_t max = 0;
    if (!RunAta(c, nullptr, &max))
        return false;
    native = max + 1;
    return true;
}

bool CDevice::ReadDco(std::uint8_t *dco)
{
    Ata::Command c;
    c.command = Ata::Code::DeviceConfiguration;
    c.features = Ata::DcoFeature::Identify;
    c.direction = Ata::Direction::In;
    return RunAta(c, dco, nullptr) && AtaIdentify::DcoChecksumValid(dco);
}

bool CDevice::GetNativeSizes(std::uint64_t &accessible, std::uint64_t &hpaNative, std::uint64_t &dcoNative)
{
    accessible = hpaNative = dcoNative = 0;
    std::uint8_t id[AtaIdentify::Size];
    if (!ReadIdentify(id))
        return false;
    bool uses48 = false;
    accessible = AtaIdentify::AccessibleSectors(id, uses48);

    if (ReadHpaNative(uses48, hpaNative) && hpaNative < accessible)
        hpaNative = 0;

    std::uint8_t dco[AtaIdentify::Size];
    if (ReadDco(dco)) {
        const std::uint64_t native = AtaIdentify::DcoMaxAddress(dco) + 1;
        dcoNative = accessible <= native ? native : 0;
    }
    return uses48;
}

bool CDevice::SetHpa(std::uint64_t hidden)
{
    std::uint8_t id[AtaIdentify::Size];
    if (!ReadIdentify(id))
        return false;
    bool uses48 = false;
    const std::uint64_t accessible = AtaIdentify::AccessibleSectors(id, uses48);
    std::uint64_t native = 0;
    if (!ReadHpaNative(uses48, native) || native < accessible)
        return false;
    // At least one sector must stay visible.
    if (native < 2 || hidden >= native - 1)
        return false;
    const std::uint64_t newMax = native - hidden - 1;
    Ata::Command c;
    c.ext48 = uses48 || newMax > 0x0FFFFFFF;
    c.command = c.ext48 ? Ata::Code::SetMaxAddressExt : Ata::Code::SetMaxAddress;
    c.address = newMax;
    c.device = 0xE0;
    return RunAta(c, nullptr, nullptr);
}

bool CDevice::SetDco(std::uint64_t hidden)
{
    std::uint8_t dco[AtaIdentify::Size];
    if (!ReadDco(dco))
        return false;
    Ata::Command c;
    c.command = Ata::Code::DeviceConfiguration;
    if (hidden == 0) {
        c.features = Ata::DcoFeature::Restore;
        return RunAta(c, nullptr, nullptr);
    }
    const std::uint64_t oldMax = AtaIdentify::DcoMaxAddress(dco);
    // New maximum = (old maximum + 1) - hidden - 1, which must stay above 0.
    if (hidden >= oldMax)
        return false;
    AtaIdentify::SetDcoMaxAddress(dco, oldMax - hidden);
    c.features = Ata::DcoFeature::Set;
    c.direction = Ata::Direction::Out;
    return RunAta(c, dco, nullptr);
}

void CDevice::ReadIdentityStrings()
{
    if (m_info.handle) {
        std::uint8_t id[AtaIdentify::Size];
        QString model, firmware, serial;
        if (ReadIdentify(id) && AtaIdentify::Strings(id, model, firmware, serial)) {
            if (!model.isEmpty())
                m_info.model = model;
            if (!firmware.isEmpty())
                m_info.firmware = firmware;
            if (!serial.isEmpty())
                m_info.serialIdentify = serial;
        }
    }
    m_info.serial = m_info.serialIdentify;
    if (m_info.serial.isEmpty())
        m_info.serial = m_info.serialControl;
    if (m_info.serial.isEmpty())
        m_info.serial = m_info.serialManagement;
}
