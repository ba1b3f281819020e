#include "MainView.h"

#include "Commander.h"

namespace Solution {

MainView::MainView(Commander *commander, QWidget *parent) : Framework::MainView(commander, parent) {}

} // namespace Solution
