#include "ClientFramework/HighDpi.h"

#include <QByteArray>
#include <QCoreApplication>
#include <QList>

#include <cstdlib>

#ifdef BRINDLE_HAVE_XCB
#include <xcb/xcb.h>
#endif

namespace Framework {

bool decideHighDpi(std::optional<double> primaryDpi, bool noHiDpi)
{
    bool scaling = true;
    if (primaryDpi && *primaryDpi / 96.0 == 1.5)
        scaling = false;
    if (scaling && noHiDpi)
        scaling = false;
    return scaling;
}

#ifdef BRINDLE_HAVE_XCB
namespace {

std::optional<double> x11Dpi()
{
    if (qEnvironmentVariableIsEmpty("DISPLAY"))
        return std::nullopt;
    int screenNumber = 0;
    xcb_connection_t *c = xcb_connect(nullptr, &screenNumber);
    if (!c || xcb_connection_has_error(c)) {
        if (c)
            xcb_disconnect(c);
        return std::nullopt;
    }
    std::optional<double> dpi;
    xcb_screen_iterator_t it = xcb_setup_roots_iterator(xcb_get_setup(c));
    for (int i = 0; i < screenNumber && it.rem; ++i)
        xcb_screen_next(&it);
    if (xcb_screen_t *screen = it.rem ? it.data : nullptr) {
        // The resource database first: it is what desktop settings change.
        xcb_get_property_cookie_t cookie =
            xcb_get_property(c, 0, screen->root, XCB_ATOM_RESOURCE_MANAGER, XCB_ATOM_STRING, 0, 16384);
        if (xcb_get_property_reply_t *reply = xcb_get_property_reply(c, cookie, nullptr)) {
            const int len = xcb_get_property_value_length(reply);
            const QByteArray resources(static_cast<const char *>(xcb_get_property_value(reply)), len);
            std::free(reply);
            for (const QByteArray &line : resources.split('\n')) {
                if (!line.startsWith("Xft.dpi:"))
                    continue;
                bool ok = false;
                const double v = line.mid(8).trimmed().toDouble(&ok);
                if (ok && v > 0)
                    dpi = v;
            }
        }
        // Without the resource the effective DPI of an X display is 96, whatever its physical size.
        if (!dpi)
            dpi = 96.0;
    }
    xcb_disconnect(c);
    return dpi;
}

} // namespace
#endif

std::optional<double> primaryScreenDpi()
{
    bool ok = false;
    const int forced = qEnvironmentVariableIntValue("QT_FONT_DPI", &ok);
    if (ok && forced > 0)
        return forced;
    const QByteArray platform = qgetenv("QT_QPA_PLATFORM");
    if (!platform.isEmpty() && !platform.startsWith("xcb"))
        return std::nullopt;
#ifdef BRINDLE_HAVE_XCB
    return x11Dpi();
#else
    return std::nullopt;
#endif
}

void applyHighDpi(bool scaling)
{
    if (!scaling) {
        // Qt 6 always scales by the screen's factor; this switch makes it use device pixels again.
        qputenv("QT_ENABLE_HIGHDPI_SCALING", "0");
        qunsetenv("QT_SCALE_FACTOR");
        qunsetenv("QT_SCREEN_SCALE_FACTORS");
    }
    QCoreApplication::setSetuidAllowed(true);
}

} // namespace Framework
