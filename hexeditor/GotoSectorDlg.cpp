#include "hexeditor/GotoSectorDlg.h"

#include "hexeditor/HexInt64Validator.h"

#include <QDialogButtonBox>
#include <QGridLayout>
#include <QLabel>
#include <QLineEdit>
#include <QVBoxLayout>

namespace HexEditor {

namespace {

int64_t toSigned(uint64_t v)
{
    return v > static_cast<uint64_t>(INT64_MAX) ? INT64_MAX : static_cast<int64_t>(v);
}

} // namespace

GotoSectorDlg::GotoSectorDlg(uint64_t sectorCount, uint32_t sectorSize, std::optional<Clusters> clusters,
                             uint64_t currentSector, QWidget *parent)
    : QDialog(parent), m_sectorCount(sectorCount), m_sectorSize(sectorSize), m_clusters(std::move(clusters))
{
    setWindowTitle(tr("Go to Sector"));
    setObjectName(QStringLiteral("GotoSectorDlg"));
    if (m_clusters && (!m_clusters->sectorToCluster || !m_clusters->clusterToSector ||
                       m_clusters->last < m_clusters->first))
        m_clusters.reset();

    auto *layout = new QVBoxLayout(this);
    auto *grid = new QGridLayout;
    const int64_t lastSector = sectorCount ? toSigned(sectorCount - 1) : 0;
    grid->addWidget(new QLabel(tr("Sector:"), this), 0, 0);
    m_sector = new QLineEdit(this);
    m_sector->setObjectName(QStringLiteral("edtSector"));
    m_sectorValidator = new HexInt64Validator(0, lastSector, m_sector);
    m_sector->setValidator(m_sectorValidator);
    grid->addWidget(m_sector, 0, 1);
    m_sectorRange = new QLabel(this);
    grid->addWidget(m_sectorRange, 0, 2);

    grid->addWidget(new QLabel(tr("Cluster:"), this), 1, 0);
    m_cluster = new QLineEdit(this);
    m_cluster->setObjectName(QStringLiteral("edtCluster"));
    m_clusterValidator = new HexInt64Validator(m_clusters ? toSigned(m_clusters->first) : 0,
                                               m_clusters ? toSigned(m_clusters->last) : 0, m_cluster);
    m_cluster->setValidator(m_clusterValidator);
    grid->addWidget(m_cluster, 1, 1);
    m_clusterRange = new QLabel(this);
    grid->addWidget(m_clusterRange, 1, 2);
    layout->addLayout(grid);
    layout->addWidget(new QLabel(tr("Use 0x prefix for hexadecimal values"), this));

    const QLocale loc = m_sectorValidator->locale();
    m_sectorRange->setText(
        tr("(%1 - %2)").arg(loc.toString(qlonglong(0)), loc.toString(static_cast<qlonglong>(lastSector))));
    if (m_clusters)
        m_clusterRange->setText(tr("(%1 - %2)")
                                    .arg(loc.toString(static_cast<qulonglong>(m_clusters->first)),
                                         loc.toString(static_cast<qulonglong>(m_clusters->last))));
    else
        m_cluster->setEnabled(false);

    auto *buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel, this);
    connect(buttons, &QDialogButtonBox::accepted, this, &QDialog::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    layout->addWidget(buttons);

    connect(m_sector, &QLineEdit::textEdited, this, &GotoSectorDlg::onSectorEdited);
    connect(m_cluster, &QLineEdit::textEdited, this, &GotoSectorDlg::onClusterEdited);

    if (sectorCount && currentSector < sectorCount) {
        m_sector->setText(loc.toString(static_cast<qulonglong>(currentSector)));
        onSectorEdited(m_sector->text());
    }
    m_sector->selectAll();
}

QString GotoSectorDlg::sectorRangeText() const
{
    return m_sectorRange->text();
}

QString GotoSectorDlg::clusterRangeText() const
{
    return m_clusterRange->text();
}

QString GotoSectorDlg::numberText(uint64_t value, bool hex) const
{
    if (hex)
        return QStringLiteral("0x") + QString::number(value, 16).toUpper();
    return m_sectorValidator->locale().toString(static_cast<qulonglong>(value));
}

void GotoSectorDlg::onSectorEdited(const QString &text)
{
    if (m_updating || !m_clusters)
        return;
    m_updating = true;
    const std::optional<int64_t> v = m_sectorValidator->acceptedValue(text);
    if (v) {
        const uint64_t cluster = m_clusters->sectorToCluster(static_cast<uint64_t>(*v));
        if (cluster >= m_clusters->first && cluster <= m_clusters->last)
            m_cluster->setText(numberText(cluster, HexInt64Validator::isHexadecimal(text)));
        else
            m_cluster->clear();
    } else {
        m_cluster->clear();
    }
    m_updating = false;
}

void GotoSectorDlg::onClusterEdited(const QString &text)
{
    if (m_updating || !m_clusters)
        return;
    m_updating = true;
    const std::optional<int64_t> v = m_clusterValidator->acceptedValue(text);
    if (v) {
        const uint64_t sector = m_clusters->clusterToSector(static_cast<uint64_t>(*v));
        if (sector < m_sectorCount)
            m_sector->setText(numberText(sector, HexInt64Validator::isHexadecimal(text)));
        else
            m_sector->clear();
    } else {
        m_sector->clear();
    }
    m_updating = false;
}

std::optional<uint64_t> GotoSectorDlg::sector() const
{
    const std::optional<int64_t> v = m_sectorValidator->acceptedValue(m_sector->text());
    if (!v || m_sectorCount == 0)
        return std::nullopt;
    return static_cast<uint64_t>(*v);
}

std::optional<uint64_t> GotoSectorDlg::target() const
{
    const std::optional<uint64_t> s = sector();
    if (!s)
        return std::nullopt;
    return *s * m_sectorSize;
}

} // namespace HexEditor
