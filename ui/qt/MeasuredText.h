// The bytes of a multi-line edit that a length query has just converted, kept for the text
// query that normally follows it (the dialog sizes its buffer first, then reads), so a long
// script is converted once and not twice.
//
// What is kept is dropped as soon as the document changes, when it is taken, and when
// the host drops it (a new text with perhaps another encoding): a read never sees a stale
// text.
#pragma once

#include <QByteArray>
#include <QMetaObject>
#include <QPointer>
#include <QTextDocument>

namespace ui {

class MeasuredText {
public:
    MeasuredText() = default;
    ~MeasuredText() { Drop(); }

    MeasuredText(const MeasuredText&) = delete;
    MeasuredText& operator=(const MeasuredText&) = delete;

    void Keep(QTextDocument* document, QByteArray bytes);
    // The bytes kept for document, handed over; false when none are kept for it.
    bool Take(const QTextDocument* document, QByteArray& bytes);
    void Drop();

private:
    QPointer<QTextDocument> document_;
    QByteArray bytes_;
    QMetaObject::Connection changed_;
};

} // namespace ui
