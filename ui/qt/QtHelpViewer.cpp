#include "ui/qt/QtHelpViewer.h"

#include <QCloseEvent>
#include <QTextBrowser>
#include <QUrl>
#include <QVBoxLayout>
#include <QWidget>

#include <cstring>

namespace ui {

// The viewer's window: the topic in a browser whose links the viewer follows itself.
class HelpWindow final : public QWidget {
public:
    explicit HelpWindow(QtHelpViewer& viewer) : viewer_(viewer)
    {
        setWindowTitle(QStringLiteral("Trouble Shooter"));
        setObjectName(QStringLiteral("helpViewer"));
        browser_ = new QTextBrowser(this);
        browser_->setOpenLinks(false);
        browser_->setOpenExternalLinks(false);
        auto* layout = new QVBoxLayout(this);
        layout->setContentsMargins(0, 0, 0, 0);
        layout->addWidget(browser_);
        resize(560, 420);
        connect(browser_, &QTextBrowser::anchorClicked, this,
                [this](const QUrl& link) { viewer_.FollowLink(link); });
    }

    QTextBrowser* browser() const { return browser_; }

protected:
    void closeEvent(QCloseEvent* event) override
    {
        event->accept();
        viewer_.windowClosed();
    }

private:
    QtHelpViewer& viewer_;
    QTextBrowser* browser_ = nullptr;
};

QtHelpViewer::QtHelpViewer(WindowHost& host, std::string helpDirectory)
    : host_(host), helpDirectory_(std::move(helpDirectory))
{
}

QtHelpViewer::~QtHelpViewer() = default;

QWidget* QtHelpViewer::window() const
{
    return window_.get();
}

QTextBrowser* QtHelpViewer::browser() const
{
    return window_ ? window_->browser() : nullptr;
}

int QtHelpViewer::OpenFile(WindowHandle owner, const char* file)
{
    if (file == nullptr || file[0] == '\0')
        return 0;
    const std::string path =
        std::strchr(file, '/') != nullptr ? std::string(file) : helpDirectory_ + file;
    if (!document_.Load(path))
        return 0;
    owner_ = owner;
    open_ = true;
    closing_ = false;
    currentTopic_.clear();
    if (!window_)
        window_ = std::make_unique<HelpWindow>(*this);
    window_->browser()->clear();
    return 1;
}

int QtHelpViewer::RunMacro(WindowHandle owner, const char* file, const char* macro)
{
    std::string topic;
    if (!open_ || closing_ || !HelpDocument::ParseJumpMacro(macro, nullptr, &topic))
        return 0;
    owner_ = owner;
    return showTopic(QString::fromStdString(topic)) ? 1 : 0;
}

int QtHelpViewer::Quit(WindowHandle owner, const char* file)
{
    open_ = false;
    currentTopic_.clear();
    // Hidden, not closed: a close by the program is no close command.
    if (window_)
        window_->hide();
    return 1;
}

bool QtHelpViewer::showTopic(const QString& id)
{
    const std::string key = id.toStdString();
    if (!open_ || !window_ || !document_.HasTopic(key))
        return false;
    currentTopic_ = id;
    window_->browser()->setHtml(QString::fromUtf8(document_.TopicHtml(key)));
    window_->show();
    window_->raise();
    emit topicShown(id);
    return true;
}

void QtHelpViewer::FollowLink(const QUrl& link)
{
    if (!open_ || closing_)
        return;
    const QString href = link.toString();
    int id = 0;
    std::int32_t argument = 0;
    if (HelpDocument::ParseCommandLink(href.toStdString(), &id, &argument)) {
        if (id == kCloseCommand)
            closing_ = true;
        host_.PostMessage(owner_, kMsgCommand, MakeCommand(id), static_cast<LParam>(argument));
        emit commandSent(id, argument);
        return;
    }
    // A link to another topic of the file; the client is not told.
    if (link.scheme().isEmpty() && link.path().isEmpty() && link.hasFragment())
        showTopic(link.fragment());
}

void QtHelpViewer::CloseByUser()
{
    if (window_ && window_->isVisible())
        window_->close();
    else
        windowClosed();
}

void QtHelpViewer::windowClosed()
{
    if (!open_ || closing_)
        return;
    closing_ = true;
    host_.PostMessage(owner_, kMsgCommand, MakeCommand(kCloseCommand), 0);
    emit commandSent(kCloseCommand, 0);
}

} // namespace ui
