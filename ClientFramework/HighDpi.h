// The high-DPI decision of start-up, taken before the application object exists.
#pragma once

#include <optional>

namespace Framework {

// Scaling stays on unless the primary screen runs at exactly 1.5 times 96 DPI (144 DPI) or the
// "nohidpi" option is given. Returns whether scaling is on.
bool decideHighDpi(std::optional<double> primaryDpi, bool noHiDpi);

// The primary screen's DPI as the platform reports it before any application object exists:
// a forced font DPI (QT_FONT_DPI) first, then on X11 the effective DPI ("Xft.dpi", else 96).
// Nothing when the platform tells nothing (no X display, Wayland).
std::optional<double> primaryScreenDpi();

// Applies the decision for the application object about to be created: scaling off makes Qt keep
// device pixels (one logical pixel per device pixel). Also allows running with elevated rights.
void applyHighDpi(bool scaling);

} // namespace Framework
