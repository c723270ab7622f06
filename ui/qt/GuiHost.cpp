// The window program's host: the application object and the Qt host around it.
#include "app/GuiHost.h"

#include <QApplication>
#include <QByteArray>
#include <QStringList>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "platform/ExecutablePath.h"
#include "ui/qt/FontWarmUp.h"
#include "ui/qt/HostStyle.h"
#include "ui/qt/QtHost.h"

namespace {

// What the platform said while the application was being made. It is held back: when the
// display cannot be reached, the one line below says it all; otherwise it is passed on.
QStringList& StartupMessages()
{
    static QStringList messages;
    return messages;
}

// Qt ends the process with a fatal message when no window system can be reached. Said in
// one line, with the way out, and ended without a crash report.
void StartupMessageHandler(QtMsgType type, const QMessageLogContext& context,
                           const QString& message)
{
    if (type != QtFatalMsg) {
        StartupMessages() << message;
        return;
    }
    const QString first = !StartupMessages().isEmpty() ? StartupMessages().first() : message;
    const std::string detail = first.section(QLatin1Char('\n'), 0, 0).toStdString();
    std::fprintf(stderr,
                 "harbor: the window system cannot be reached (%s); run \"harbor --headless\" "
                 "to use Harbor without a window\n",
                 detail.c_str());
    std::fflush(stderr);
    std::_Exit(1);
}

} // namespace

namespace app {

std::unique_ptr<ui::WindowHost> CreateGuiHost(int& argc, char** argv)
{
    auto fonts = std::make_unique<ui::FontWarmUp>();
    const QtMessageHandler previous = qInstallMessageHandler(StartupMessageHandler);
    auto application = std::make_unique<QApplication>(argc, argv);
    qInstallMessageHandler(previous);
    for (const QString& message : StartupMessages())
        qWarning("%s", qPrintable(message));
    StartupMessages().clear();
    QApplication::setApplicationName(QStringLiteral("Harbor"));
    // The dialog ends the program by its Exit command, not the last window that closes:
    // the help viewer may be the last one shown.
    QApplication::setQuitOnLastWindowClosed(false);
    ui::HostStyle::Install();

    // The build and the installation put the help file into help/ beside the program.
    auto host = std::make_unique<ui::QtHost>(platform::ExecutableDirectory() + "help/");
    host->AdoptApplication(std::move(application));
    host->AdoptFontWarmUp(std::move(fonts));
    // For start-up benchmarks: the program ends as soon as its window is up.
    const char* exitWhenShown = std::getenv("HARBOR_EXIT_WHEN_SHOWN");
    if (exitWhenShown != nullptr && exitWhenShown[0] != '\0')
        host->ExitWhenShown();
    return host;
}

} // namespace app
