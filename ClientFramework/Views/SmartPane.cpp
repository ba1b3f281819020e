#include "ClientFramework/Views/SmartPane.h"

#include "ClientFramework/NodeTree/NodeCore.h"

#include "smart/SmartText.h"

#include <QAction>
#include <QBrush>
#include <QColor>
#include <QHeaderView>
#include <QLabel>
#include <QScrollArea>
#include <QTableWidget>
#include <QToolBar>
#include <QTreeWidget>
#include <QVBoxLayout>

#include <algorithm>

namespace Framework {

namespace {

QLabel *sectionTitle(const QString &text, QWidget *parent)
{
    auto *label = new QLabel(text, parent);
    QFont bold = label->font();
    bold.setBold(true);
    label->setFont(bold);
    return label;
}

QString decimal(std::uint64_t value)
{
    return QString::number(value);
}

} // namespace

SmartPane::SmartPane(QWidget *parent)
    : GenericView(ViewId, tr("SMART Info"), parent), m_refresh(new QAction(tr("Refresh"), this)),
      m_hint(new QLabel(tr("Select a Physical Device (disk) to view S.M.A.R.T."))), m_sections(new QWidget),
      m_deviceName(new QLabel), m_parameters(new QTreeWidget), m_noParameters(new QLabel),
      m_attributes(new QTableWidget), m_noAttributes(new QLabel)
{
    m_refresh->setObjectName(QStringLiteral("smartRefresh"));
    m_refresh->setStatusTip(tr("Read the S.M.A.R.T. data of the device again."));
    connect(m_refresh, &QAction::triggered, this, &SmartPane::refresh);
    auto *bar = addToolBar(tr("SMART Info"));
    bar->setObjectName(QStringLiteral("smartToolBar"));
    bar->setMovable(false);
    bar->setToolButtonStyle(Qt::ToolButtonTextOnly);
    bar->addAction(m_refresh);

    m_hint->setObjectName(QStringLiteral("smartHint"));
    m_hint->setAlignment(Qt::AlignCenter);
    m_hint->setWordWrap(true);

    m_deviceName->setObjectName(QStringLiteral("smartDevice"));
    m_deviceName->setWordWrap(true);

    m_parameters->setObjectName(QStringLiteral("smartParameters"));
    m_parameters->setColumnCount(2);
    m_parameters->setHeaderHidden(true);
    m_parameters->setRootIsDecorated(false);
    m_parameters->setUniformRowHeights(true);
    m_parameters->header()->setSectionResizeMode(0, QHeaderView::ResizeToContents);
    m_parameters->header()->setStretchLastSection(true);
    m_noParameters->setObjectName(QStringLiteral("smartNoParameters"));
    m_noParameters->setText(tr("S.M.A.R.T. parameters are not supported"));

    m_attributes->setObjectName(QStringLiteral("smartAttributes"));
    m_attributes->setColumnCount(9);
    m_attributes->setHorizontalHeaderLabels({tr("ID"), tr("Name"), tr("Value"), tr("Worst"), tr("Threshold"),
                                             tr("Type"), tr("Updated"), tr("When Failed"), tr("Raw Value")});
    m_attributes->verticalHeader()->hide();
    m_attributes->verticalHeader()->setDefaultSectionSize(m_attributes->fontMetrics().height() + 6);
    m_attributes->setEditTriggers(QAbstractItemView::NoEditTriggers);
    m_attributes->setSelectionBehavior(QAbstractItemView::SelectRows);
    m_attributes->horizontalHeader()->setStretchLastSection(true);
    m_noAttributes->setObjectName(QStringLiteral("smartNoAttributes"));
    m_noAttributes->setText(tr("S.M.A.R.T. attributes are not supported"));

    auto *layout = new QVBoxLayout(m_sections);
    layout->setContentsMargins(4, 4, 4, 4);
    layout->addWidget(m_deviceName);
    layout->addWidget(sectionTitle(tr("S.M.A.R.T. Parameters"), m_sections));
    layout->addWidget(m_parameters, 2);
    layout->addWidget(m_noParameters);
    layout->addWidget(sectionTitle(tr("S.M.A.R.T. Attributes"), m_sections));
    layout->addWidget(m_attributes, 3);
    layout->addWidget(m_noAttributes);

    auto *page = new QWidget;
    auto *outer = new QVBoxLayout(page);
    outer->setContentsMargins(0, 0, 0, 0);
    outer->addWidget(m_hint, 1);
    outer->addWidget(m_sections, 1);
    setCentralWidget(page);
    showDevice(nullptr);
}

SmartPane::~SmartPane()
{
    detach();
}

void SmartPane::setProvider(ISmartProvider *provider)
{
    m_provider = provider ? provider : &m_none;
    refresh();
}

void SmartPane::showNodes(const QList<NodeCore *> &nodes)
{
    NodeCore *device = nullptr;
    for (NodeCore *n : nodes)
        if (n && n->kind() == NodeKind::Device) {
            device = n;
            break;
        }
    // A selection without a device keeps nothing: the pane asks for one.
    if (device != m_device)
        showDevice(device);
}

void SmartPane::showDevice(NodeCore *device)
{
    detach();
    m_device = device;
    if (m_device)
        m_device->subscribe(this);
    refresh();
}

void SmartPane::detach()
{
    if (m_device)
        m_device->unsubscribe(this);
    m_device = nullptr;
}

void SmartPane::publisherDestroyed(NodeCore *node)
{
    if (node != m_device)
        return;
    m_device = nullptr; // it unsubscribes everyone itself
    refresh();
}

void SmartPane::refresh()
{
    m_hint->setVisible(!m_device);
    m_sections->setVisible(m_device != nullptr);
    m_refresh->setEnabled(m_device != nullptr);
    m_parameters->clear();
    m_attributes->setRowCount(0);
    if (!m_device) {
        m_deviceName->clear();
        return;
    }
    m_deviceName->setText(m_device->text(NodeAttr::Name));

    SmartParameters p;
    const bool haveParameters = m_provider->readParameters(m_device, p);
    if (haveParameters)
        for (const auto &[label, value] : parameterRows(p))
            new QTreeWidgetItem(m_parameters, {label, value});
    m_parameters->setVisible(haveParameters);
    m_noParameters->setVisible(!haveParameters);

    QList<SmartAttribute> attributes;
    const bool haveAttributes = m_provider->readAttributes(m_device, attributes) && !attributes.isEmpty();
    if (haveAttributes)
        fillAttributes(std::move(attributes));
    m_attributes->setVisible(haveAttributes);
    m_noAttributes->setVisible(!haveAttributes);
}

void SmartPane::fillAttributes(QList<SmartAttribute> attributes)
{
    std::stable_sort(attributes.begin(), attributes.end(),
                     [](const SmartAttribute &a, const SmartAttribute &b) { return a.id < b.id; });
    m_attributes->setRowCount(int(attributes.size()));
    for (int row = 0; row < attributes.size(); ++row) {
        const SmartAttribute &a = attributes[row];
        const QStringList cells = {decimal(a.id),
                                   Smart::attributeName(a.id),
                                   decimal(a.value),
                                   decimal(a.worst),
                                   decimal(a.threshold),
                                   Smart::attributeTypeText(a.type),
                                   Smart::attributeUpdatedText(a.updated),
                                   Smart::whenFailedText(a.whenFailed),
                                   decimal(a.raw)};
        const QBrush background(QColor(row % 2 == 0 ? EvenRowColor : OddRowColor));
        for (int column = 0; column < cells.size(); ++column) {
            auto *item = new QTableWidgetItem(cells[column]);
            item->setBackground(background);
            if (column != 1 && column < 5)
                item->setTextAlignment(Qt::AlignRight | Qt::AlignVCenter);
            m_attributes->setItem(row, column, item);
        }
    }
    m_attributes->resizeColumnsToContents();
}

QString SmartPane::supportText(std::uint8_t support)
{
    switch (support) {
    case 1:
        return tr("Supported and enabled");
    case 2:
        return tr("Supported, the status command failed");
    case 3:
        return tr("Supported, switched off");
    default:
        return tr("Not supported");
    }
}

QList<QPair<QString, QString>> SmartPane::parameterRows(const SmartParameters &p)
{
    const QString version = p.ataMajor == 255 ? tr("Not reported") : decimal(p.ataMajor);
    return {
        {tr("Device Model:"), p.model},
        {tr("Serial Number:"), p.serial},
        {tr("Firmware Version:"), p.firmware},
        {tr("Capacity:"), tr("%1 (%2)").arg(NodeCore::sizeText(p.capacity), decimal(p.capacity))},
        {tr("ATA Version:"), version},
        {tr("ATA Standard:"), Smart::ataStandardText(p.ataMinor)},
        {tr("SMART Support:"), supportText(p.support)},
        {tr("Off-line Data Collection Status:"), decimal(p.offlineStatus)},
        {tr("Self-test Execution Status:"), decimal(p.selfTestStatus)},
        {tr("Time Off-line Data Collection, sec:"), decimal(p.offlineSeconds)},
        {tr("Off-line Data Collection Capabilities:"), decimal(p.offlineCapability)},
        {tr("SMART Capabilities:"), decimal(p.smartCapability)},
        {tr("Error Logging Capabilities:"), decimal(p.errorLogCapability)},
        {tr("Short Self-test Time, min:"), decimal(p.shortTestMinutes)},
        {tr("Extended Self-test Time, min:"), decimal(p.extendedTestMinutes)},
    };
}

} // namespace Framework
