// A file found on a volume of the kernel (one the platform cannot see), presented as a read-only
// platform file of kind File: reads go through the source's byte read, writes are refused.
#pragma once

#include "Kernel/Implementation/Platform/PlatformFile.h"

class cStorage;

class CPlatformFileX : public CPlatformFile
{
public:
    // The source stays owned by its volume and must outlive this handle.
    CPlatformFileX(cRoot *owner, const QString &name, cStorage *source);
    ~CPlatformFileX() override;

    bool IsWritable() override;
    bool IsOpened() override;
    bool SetWritable(bool writable) override;
    bool Create() override;
    bool Reopen(bool report) override;
    bool GetSize(uint64_t &size) override;
    bool Resize(uint64_t newSize) override;
    bool GetPosition(uint64_t &position) override;
    bool ReadWrite(bool read, uint64_t pos, uint32_t size, void *buffer) override;
    bool Close(bool deleteFile = false) override;

    cStorage *GetSource() const { return m_source; }

private:
    cStorage *m_source = nullptr;
    bool m_open = false;
    uint64_t m_position = 0;
};
