#include "ui/qt/MeasuredText.h"

#include <utility>

namespace ui {

void MeasuredText::Keep(QTextDocument* document, QByteArray bytes)
{
    Drop();
    if (document == nullptr)
        return;
    document_ = document;
    bytes_ = std::move(bytes);
    changed_ =
        QObject::connect(document, &QTextDocument::contentsChanged, document, [this] { Drop(); });
}

bool MeasuredText::Take(const QTextDocument* document, QByteArray& bytes)
{
    if (document == nullptr || document_.data() != document)
        return false;
    bytes = std::move(bytes_);
    Drop();
    return true;
}

void MeasuredText::Drop()
{
    if (changed_)
        QObject::disconnect(changed_);
    changed_ = {};
    document_.clear();
    bytes_.clear();
}

} // namespace ui
