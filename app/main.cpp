// The desktop program's entry point.
#include <QApplication>
#include <QMainWindow>

#include "ClientFramework/AppIdentity.h"

int main(int argc, char **argv)
{
    QApplication app(argc, argv);
    QMainWindow window;
    window.setWindowTitle(Framework::Identity::FullName);
    window.show();
    return app.exec();
}
