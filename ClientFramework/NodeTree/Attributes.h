// A set of attribute texts keyed by an attribute code: the text of one attribute, and a value for
// a display role (the text for the display role).
#pragma once

#include <QString>
#include <QVariant>

template <typename A> class Attributes
{
public:
    virtual ~Attributes() = default;

    virtual QString text(A attr) const = 0;
    virtual QVariant data(A attr, int role) const { return role == 0 ? QVariant(text(attr)) : QVariant(); }
};
