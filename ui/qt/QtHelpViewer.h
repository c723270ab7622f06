// The help viewer of the window program: a window that shows one topic of the help file at a
// time. A plain link shows another topic; a command link ("cmd:2004?3") is sent to the
// Trouble Shooter's hidden "trbl_wnd" window as a command message, and the client answers by
// asking for the next topic. Closing the window counts as the help file's close command.
#pragma once

#include <QObject>
#include <QPointer>
#include <QString>

#include <cstdint>
#include <memory>
#include <string>

#include "troubleshooter/HelpDocument.h"
#include "troubleshooter/HelpViewer.h"

class QTextBrowser;
class QUrl;
class QWidget;

namespace ui {

class HelpWindow;

class QtHelpViewer final : public QObject, public HelpViewer {
    Q_OBJECT

public:
    // helpDirectory: where a file name without directory is looked for, with a trailing
    // "/" ("" for the current directory).
    QtHelpViewer(WindowHost& host, std::string helpDirectory);
    ~QtHelpViewer() override;

    int OpenFile(WindowHandle owner, const char* file) override;
    int RunMacro(WindowHandle owner, const char* file, const char* macro) override;
    int Quit(WindowHandle owner, const char* file) override;

    bool IsOpen() const { return open_; }
    const QString& currentTopic() const { return currentTopic_; }
    // The viewer's window; null before the first file was opened.
    QWidget* window() const;
    QTextBrowser* browser() const;

    // Closes the window as the user would: the close command goes to the client once.
    void CloseByUser();

    // What a click on a link of the shown topic does.
    void FollowLink(const QUrl& link);

    static constexpr int kCloseCommand = 2000;

signals:
    // A topic is on show.
    void topicShown(const QString& id);
    // A command link was sent to the client.
    void commandSent(int id, qint32 argument);

private:
    friend class HelpWindow;

    bool showTopic(const QString& id);
    // The user closed the window.
    void windowClosed();

    WindowHost& host_;
    std::string helpDirectory_;
    HelpDocument document_;
    std::unique_ptr<HelpWindow> window_;
    bool open_ = false;
    // The close command was sent: the window stays closed whatever still arrives.
    bool closing_ = false;
    WindowHandle owner_ = kNoWindow;
    QString currentTopic_;
};

} // namespace ui
