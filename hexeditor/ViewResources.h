// The hex editor's icons are compiled into its static library: this makes them known to Qt's
// resource system (once) before a view, its actions or its status bar look them up.
#pragma once

namespace HexEditor {

void initViewResources();

} // namespace HexEditor
