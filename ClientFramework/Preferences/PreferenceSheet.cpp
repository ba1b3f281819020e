#include "ClientFramework/Preferences/PreferenceSheet.h"

#include <QFormLayout>
#include <QVBoxLayout>

namespace Framework {

PreferenceSheet::PreferenceSheet(const QString &objectName, std::function<QDomElement()> element,
                                 QWidget *parent)
    : QWidget(parent), m_element(std::move(element)), m_layout(new QVBoxLayout(this)), m_form(new QFormLayout)
{
    setObjectName(objectName);
    if (!m_element)
        m_element = [] { return QDomElement(); };
    m_form->setFieldGrowthPolicy(QFormLayout::AllNonFixedFieldsGrow);
    m_layout->addLayout(m_form);
    m_layout->addStretch(1);
}

void PreferenceSheet::addBelowForm(QWidget *widget)
{
    m_layout->insertWidget(m_layout->count() - 1, widget);
}

} // namespace Framework
