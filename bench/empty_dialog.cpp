// The start-up baseline: a bare Qt Widgets program that shows one empty dialog. Started as
// harbor is, it says "shown" once the dialog has been shown and painted, then ends.
#include <QApplication>
#include <QDialog>
#include <QTimer>

#include <cstdio>

int main(int argc, char** argv)
{
    QApplication application(argc, argv);
    QDialog dialog;
    dialog.show();
    // Queued behind the show's expose and paint, as harbor's hook is.
    QTimer::singleShot(0, &dialog, [&] {
        std::fputs("shown\n", stdout);
        std::fflush(stdout);
        dialog.close();
        QApplication::quit();
    });
    return application.exec();
}
