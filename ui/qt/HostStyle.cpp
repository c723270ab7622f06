#include "ui/qt/HostStyle.h"

#include <QApplication>
#include <QIconEngine>
#include <QPainter>
#include <QPixmap>
#include <QPointer>

namespace ui {

namespace {

// Stands for one of the base style's icons and asks for it only when it is needed.
class DeferredIconEngine final : public QIconEngine {
public:
    DeferredIconEngine(const QStyle* style, QStyle::StandardPixmap which)
        : style_(style), which_(which)
    {
    }

    void paint(QPainter* painter, const QRect& rect, QIcon::Mode mode, QIcon::State state) override
    {
        icon().paint(painter, rect, Qt::AlignCenter, mode, state);
    }

    QPixmap pixmap(const QSize& size, QIcon::Mode mode, QIcon::State state) override
    {
        return icon().pixmap(size, mode, state);
    }

    QPixmap scaledPixmap(const QSize& size, QIcon::Mode mode, QIcon::State state,
                         qreal scale) override
    {
        return icon().pixmap(size, scale, mode, state);
    }

    QSize actualSize(const QSize& size, QIcon::Mode mode, QIcon::State state) override
    {
        return icon().actualSize(size, mode, state);
    }

    QList<QSize> availableSizes(QIcon::Mode mode, QIcon::State state) override
    {
        return icon().availableSizes(mode, state);
    }

    // Asking whether the icon is null must not load it: a button asks when it is given one.
    bool isNull() override { return false; }

    QString key() const override { return QStringLiteral("HarborDeferredIcon"); }

    QIconEngine* clone() const override { return new DeferredIconEngine(style_, which_); }

private:
    const QIcon& icon()
    {
        if (!loaded_ && style_ != nullptr) {
            loaded_ = true;
            icon_ = style_->standardIcon(which_);
        }
        return icon_;
    }

    QPointer<const QStyle> style_; // the proxy owns it; it may change styles
    QStyle::StandardPixmap which_;
    bool loaded_ = false;
    QIcon icon_;
};

} // namespace

HostStyle::HostStyle(const QString& key) : QProxyStyle(key) {}

// The application owns the style it is given; the analyser does not know that.
// NOLINTBEGIN(clang-analyzer-cplusplus.NewDeleteLeaks)
void HostStyle::Install()
{
    // By name: the application deletes its own style when it is given another.
    QApplication::setStyle(new HostStyle(QApplication::style()->name()));
}
// NOLINTEND(clang-analyzer-cplusplus.NewDeleteLeaks)

QIcon HostStyle::standardIcon(StandardPixmap which, const QStyleOption* option,
                              const QWidget* widget) const
{
    if (which == SP_ToolBarHorizontalExtensionButton || which == SP_ToolBarVerticalExtensionButton)
        return QIcon(new DeferredIconEngine(baseStyle(), which));
    return QProxyStyle::standardIcon(which, option, widget);
}

} // namespace ui
