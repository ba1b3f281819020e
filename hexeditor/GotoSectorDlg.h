// "Go to Sector": a sector number and, on storages with clusters, the matching cluster number; each
// field follows the other through the volume's conversions.
#pragma once

#include <QDialog>

#include <cstdint>
#include <functional>
#include <optional>

class QLabel;
class QLineEdit;

namespace HexEditor {

class HexInt64Validator;

class GotoSectorDlg : public QDialog
{
    Q_OBJECT
public:
    // The clusters of the volume behind a storage, in the storage's sector numbering.
    struct Clusters
    {
        uint64_t first = 0;
        uint64_t last = 0;
        std::function<uint64_t(uint64_t sector)> sectorToCluster;
        std::function<uint64_t(uint64_t cluster)> clusterToSector;
    };

    GotoSectorDlg(uint64_t sectorCount, uint32_t sectorSize, std::optional<Clusters> clusters,
                  uint64_t currentSector = 0, QWidget *parent = nullptr);

    QLineEdit *sectorEdit() const { return m_sector; }
    QLineEdit *clusterEdit() const { return m_cluster; }
    QString sectorRangeText() const;
    QString clusterRangeText() const;

    // The sector in the field, none when it is empty or out of range.
    std::optional<uint64_t> sector() const;
    // The byte offset to go to: the sector times the sector size.
    std::optional<uint64_t> target() const;

private:
    void onSectorEdited(const QString &text);
    void onClusterEdited(const QString &text);
    QString numberText(uint64_t value, bool hex) const;

    uint64_t m_sectorCount;
    uint32_t m_sectorSize;
    std::optional<Clusters> m_clusters;
    QLineEdit *m_sector;
    QLineEdit *m_cluster;
    HexInt64Validator *m_sectorValidator;
    HexInt64Validator *m_clusterValidator;
    QLabel *m_sectorRange;
    QLabel *m_clusterRange;
    bool m_updating = false;
};

} // namespace HexEditor
