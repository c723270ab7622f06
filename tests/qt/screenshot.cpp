// Makes the README's picture of the window: harbor's embedded default beside this program,
// a sample script opened at start-up and downloaded, and the window grabbed into a PNG file.
// Run on the offscreen platform with real fonts installed:
//   QT_QPA_PLATFORM=offscreen harbor_screenshot docs/screenshot.png
#include <QApplication>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QTest>

#include <cstdio>
#include <string>

#include "platform/ExecutablePath.h"
#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/QtHost.h"

int main(int argc, char** argv)
{
    QApplication application(argc, argv);
    if (argc != 2) {
        std::fprintf(stderr, "usage: harbor_screenshot OUTPUT.png\n");
        return 2;
    }
    // The settings beside "harbor" in this folder are the embedded default.
    const std::string folder = platform::ExecutableDirectory();
    const std::string commandLine = "\"" + folder + "harbor\" " + folder + "samples/music.onyx2";

    ui::QtHost host(folder + "help/");
    int status = 0;
    {
        ui::TestClientDialog dialog(host, commandLine.c_str());
        if (!dialog.Create()) {
            std::fprintf(stderr, "harbor_screenshot: no window\n");
            return 1;
        }
        ui::DialogWindow* window = host.dialogWindow(dialog.handle());
        auto* statusBox = qobject_cast<QPlainTextEdit*>(window->control(ui::IdStatusBox));
        qobject_cast<QPushButton*>(window->control(ui::IdDownload))->click();
        const bool done = QTest::qWaitFor(
            [statusBox] {
                return statusBox->toPlainText().startsWith(QStringLiteral("Downloaded ok"));
            },
            30000);
        QTest::qWait(50);
        if (!done) {
            std::fprintf(stderr, "harbor_screenshot: the download did not finish: %s\n",
                         qPrintable(statusBox->toPlainText()));
            status = 1;
        } else if (!window->grab().save(QString::fromLocal8Bit(argv[1]), "PNG")) {
            std::fprintf(stderr, "harbor_screenshot: cannot write %s\n", argv[1]);
            status = 1;
        }
    }
    return status;
}
