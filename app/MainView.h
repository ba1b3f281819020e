// The product's main window: the framework window with this product's views and commands.
#pragma once

#include "ClientFramework/Views/MainView.h"

namespace Solution {

class Commander;

class MainView : public Framework::MainView
{
    Q_OBJECT
public:
    explicit MainView(Commander *commander, QWidget *parent = nullptr);
};

} // namespace Solution
