// A component that keeps its state in its own element of the settings document.
#pragma once

#include <QDomElement>

class IPersistenceXML
{
public:
    virtual ~IPersistenceXML() = default;

    // Saves the state into the element; with flush the settings file is written afterwards.
    virtual void save(QDomElement &element, bool flush = false) = 0;
    // Loads the state from the element.
    virtual void load(const QDomElement &element) = 0;
};
