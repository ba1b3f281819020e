// A file-system entry: a folder, a file or a service area of a volume. Its bytes are reached
// through its run handle; its children are produced by the file system on first use.
#pragma once

#include <QByteArray>
#include <QString>

#include <cstdint>
#include <memory>
#include <vector>

#include "Kernel/Implementation/Common/cStorage.h"
#include "Kernel/Implementation/FS/EntryHandle.h"

class CVolume;

class cEntry : public cStorage
{
public:
    StorageKind GetStorageKind() const override { return StorageKind::Entry; }

    virtual QString GetName() const = 0;
    virtual std::uint64_t GetPosition() const = 0;
    virtual std::uint32_t GetAttributes() const = 0;
    virtual std::uint32_t GetChildCount() = 0;
    virtual cEntry *GetChild(std::uint32_t index) = 0;
};

class CEntry : public cEntry
{
public:
    // Attribute bits the kernel adds above the file system's own.
    static constexpr std::uint32_t AttrFolder = 0x10;
    static constexpr std::uint32_t AttrSectorPosition = 0x20000000; // position is a volume sector
    static constexpr std::uint32_t AttrSystemArea = 0x40000000;     // a service entry
    static constexpr std::uint64_t NoIndex = 0xFFFFFFFFFFFFFFFFull;

    // `parent` null makes a top-level entry of `volume`.
    CEntry(CVolume *volume, CEntry *parent, const QString &name, std::uint64_t position,
           std::uint32_t attributes, std::uint64_t index = NoIndex);
    ~CEntry() override;

    // cStorage: the entry's data, in the volume's sector size.
    QString GetDisplayName() const override { return GetName(); }
    std::uint64_t GetSize() const override;
    std::uint32_t GetBytesPerSector() const override;
    std::uint64_t GetTotalSectors() const override;
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override;
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override;
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override;
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override;
    // The volume's flush.
    bool Flush(std::uint32_t &error) override;

    // cEntry
    QString GetName() const override;
    std::uint64_t GetPosition() const override { return m_position; }
    std::uint32_t GetAttributes() const override { return m_attributes; }
    std::uint32_t GetChildCount() override;
    cEntry *GetChild(std::uint32_t index) override;

    // Folders before files, then the names unit by unit (a prefix first), then the lower
    // position first: -1, 0 or 1.
    virtual int Compare(const CEntry &other) const;

    void SetName(const QString &name);
    // The compact form: a 16-bit header (bit 15: two bytes per character, low 15 bits: the
    // length) and the characters.
    const QByteArray &GetCompactName() const { return m_name; }
    void SetPosition(std::uint64_t position) { m_position = position; }
    void SetAttributes(std::uint32_t attributes) { m_attributes = attributes; }
    // The size in bytes; until set, the run handle's total.
    void SetSize(std::uint64_t size) { m_size = size; }
    bool IsFolder() const { return (m_attributes & AttrFolder) != 0; }

    CVolume *GetVolume() const { return m_volume; }
    CEntry *GetParent() const { return m_parent; }
    std::uint64_t GetIndex() const { return m_index; }
    CEntryHandle &GetHandle() { return m_handle; }
    const CEntryHandle &GetHandle() const { return m_handle; }
    QByteArray &State() { return m_state; }

    // Takes ownership of a child (the file system's directory reader calls this).
    CEntry *AddChild(std::unique_ptr<CEntry> child);
    bool ChildrenLoaded() const { return m_loaded; }

protected:
    // Fills the children of a folder; the base has none.
    virtual void LoadChildren() {}
    // Fills the run handle when the data is first needed; the base keeps what was added.
    virtual void LoadRuns() {}

private:
    // Where the entry's last sector ends, in bytes.
    std::uint64_t SectorsEnd() const;
    void EnsureChildren();
    void EnsureRuns();

    CVolume *m_volume = nullptr;
    CEntry *m_parent = nullptr;
    std::uint64_t m_index = NoIndex;
    std::vector<std::unique_ptr<CEntry>> m_children;
    bool m_loaded = false;
    bool m_runsLoaded = false;
    QByteArray m_name;
    std::uint64_t m_position = 0;
    std::uint32_t m_attributes = 0;
    std::uint64_t m_size = NoIndex;
    QByteArray m_state;
    CEntryHandle m_handle;
};
