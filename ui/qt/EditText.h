// The bytes of an edit control's text and the QString a Qt widget holds, both ways.
//
// The dialog deals in 8-bit texts and byte offsets, as an edit control of the Win32 API does,
// and expects the bytes it puts in to come back unchanged: a script with CR LF line ends is
// saved with CR LF again, one in another encoding keeps its bytes. A Qt text widget holds
// lines and characters, so each control remembers how its last text was written — line ends
// and encoding — and writes its text back out the same way.
#pragma once

#include <QByteArray>
#include <QString>

namespace ui {

struct EditEncoding {
    bool crlf = false;   // line ends are CR LF (otherwise LF)
    bool latin1 = false; // the bytes were not UTF-8: one character per byte
};

// A document's raw text (which keeps every character, a no-break space included) with its
// paragraph and line separators as line feeds.
QString PlainLines(QString text);

// Decodes text as UTF-8, or byte by byte when it is not valid UTF-8, and turns CR LF and a
// lone CR into a line break. encoding tells how to write the result back.
QString DecodeEditText(const QByteArray& bytes, EditEncoding& encoding);

// The widget's text as bytes written the way encoding says. With documentBreaks, a
// document's paragraph and line separators are line breaks too, so a document's raw text
// goes out in one pass, without PlainLines first.
QByteArray EncodeEditText(QStringView text, const EditEncoding& encoding,
                          bool documentBreaks = false);

// A byte offset into EncodeEditText(text) as a character position of text, and back. An
// offset inside a multi-byte character or a CR LF pair counts as the position after it;
// offsets outside the text are clamped to its ends.
int PositionOfByteOffset(const QString& text, const EditEncoding& encoding, qint64 offset);
qint64 ByteOffsetOfPosition(const QString& text, const EditEncoding& encoding, int position);

} // namespace ui
