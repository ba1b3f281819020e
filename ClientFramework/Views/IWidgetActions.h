// A view's own actions for the main window's "&Actions", "&Edit" and "&View" menus, shown while the
// view is the active one.
#pragma once

#include <QList>

class QAction;

class IWidgetActions
{
public:
    enum Menu { ActionsMenu, EditMenu, ViewMenu };

    virtual ~IWidgetActions() = default;
    // The actions of one menu in order (nullptr is a separator).
    virtual QList<QAction *> widgetActions(Menu menu) const
    {
        (void)menu;
        return {};
    }
};
