// The style the window program runs with: the platform's own, except that the tool-bar
// extension arrows are looked up when first painted instead of when their button is made.
//
// Every menu bar makes a hidden extension button at once, and the stock style fetches its
// arrow from an image file, which has Qt load and ask every image-format plugin (and the
// JPEG library) before falling back to its own PNG reader — a few milliseconds of start-up
// for an arrow that Harbor's fixed-size window never shows.
#pragma once

#include <QProxyStyle>

namespace ui {

class HostStyle final : public QProxyStyle {
public:
    // Over the style named key, as QStyleFactory knows it.
    explicit HostStyle(const QString& key);

    // Puts the host style over the style the platform, QT_STYLE_OVERRIDE or -style chose.
    // The application object must exist; it owns the style from then on.
    static void Install();

    QIcon standardIcon(StandardPixmap which, const QStyleOption* option = nullptr,
                       const QWidget* widget = nullptr) const override;
};

} // namespace ui
