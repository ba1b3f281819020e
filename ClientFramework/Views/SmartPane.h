// The SMART pane ("smart", "SMART Info"): the SMART parameters and attribute table of the device
// selected in the active node view, read through a provider; "Refresh" reads them again.
#pragma once

#include "ClientFramework/NodeTree/IPublisher.h"
#include "ClientFramework/Views/GenericView.h"
#include "ClientFramework/Views/SmartProvider.h"

#include <memory>

class QAction;
class QLabel;
class QTableWidget;
class QTreeWidget;

namespace Framework {

class SmartPane : public GenericView, private INodeSubscriber
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("smart");
    static inline const QString EvenRowColor = QStringLiteral("#FAFAFA");
    static inline const QString OddRowColor = QStringLiteral("#F0F0F0");

    explicit SmartPane(QWidget *parent = nullptr);
    ~SmartPane() override;

    // The source of SMART data (not owned; nullptr: the device gives none).
    void setProvider(ISmartProvider *provider);

    // Follows a node selection: the first device among the nodes, or none.
    void showNodes(const QList<NodeCore *> &nodes);
    // Shows one device (nullptr: the hint to select one) and reads its data.
    void showDevice(NodeCore *device);
    NodeCore *device() const { return m_device; }
    // Reads the shown device's data again.
    void refresh();

    QAction *refreshAction() const { return m_refresh; }
    QLabel *hintLabel() const { return m_hint; }
    QLabel *deviceLabel() const { return m_deviceName; }
    QTreeWidget *parameterTree() const { return m_parameters; }
    QLabel *parametersMissingLabel() const { return m_noParameters; }
    QTableWidget *attributeTable() const { return m_attributes; }
    QLabel *attributesMissingLabel() const { return m_noAttributes; }

    // The rows of the parameter section (label, value).
    static QList<QPair<QString, QString>> parameterRows(const SmartParameters &p);
    static QString supportText(std::uint8_t support);

private:
    void publisherDestroyed(NodeCore *node) override;
    void detach();
    void fillAttributes(QList<SmartAttribute> attributes);

    NoSmartProvider m_none;
    ISmartProvider *m_provider = &m_none;
    NodeCore *m_device = nullptr;
    QAction *m_refresh;
    QLabel *m_hint;
    QWidget *m_sections;
    QLabel *m_deviceName;
    QTreeWidget *m_parameters;
    QLabel *m_noParameters;
    QTableWidget *m_attributes;
    QLabel *m_noAttributes;
};

} // namespace Framework
