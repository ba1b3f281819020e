// Property groups for the property pane: titled groups of label/value pairs.
#pragma once

#include <QList>
#include <QPair>
#include <QString>

struct PropertyItem
{
    QString label;
    QString value;
    QString tip; // optional explanation of the label
};

struct PropertyGroup
{
    QString title;
    QList<PropertyItem> items;
};

class IProperty
{
public:
    virtual ~IProperty() = default;

    virtual QList<PropertyGroup> properties() const = 0;
};
