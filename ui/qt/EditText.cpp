#include "ui/qt/EditText.h"

#include <QStringDecoder>

namespace ui {

namespace {

// Bytes that one character of text takes when written out.
qint64 EncodedLength(QChar c, QChar next, const EditEncoding& encoding, int* consumed)
{
    *consumed = 1;
    if (c == QLatin1Char('\n'))
        return encoding.crlf ? 2 : 1;
    if (encoding.latin1)
        return 1;
    const char16_t u = c.unicode();
    if (QChar::isHighSurrogate(u) && QChar::isLowSurrogate(next.unicode())) {
        *consumed = 2;
        return 4;
    }
    if (u < 0x80)
        return 1;
    if (u < 0x800)
        return 2;
    return 3;
}

} // namespace

QString PlainLines(QString text)
{
    text.replace(QChar::ParagraphSeparator, QLatin1Char('\n'));
    text.replace(QChar::LineSeparator, QLatin1Char('\n'));
    return text;
}

QString DecodeEditText(const QByteArray& bytes, EditEncoding& encoding)
{
    encoding.crlf = bytes.contains("\r\n");
    QStringDecoder utf8(QStringDecoder::Utf8, QStringDecoder::Flag::Stateless);
    QString text = utf8.decode(bytes);
    encoding.latin1 = utf8.hasError();
    if (encoding.latin1)
        text = QString::fromLatin1(bytes);
    text.replace(QLatin1String("\r\n"), QLatin1String("\n"));
    text.replace(QLatin1Char('\r'), QLatin1Char('\n'));
    return text;
}

QByteArray EncodeEditText(const QString& text, const EditEncoding& encoding)
{
    QString lines = text;
    if (encoding.crlf)
        lines.replace(QLatin1Char('\n'), QLatin1String("\r\n"));
    // A character outside Latin-1 typed into a Latin-1 text cannot be written as one byte;
    // it becomes '?', as a code-page conversion would make it.
    return encoding.latin1 ? lines.toLatin1() : lines.toUtf8();
}

int PositionOfByteOffset(const QString& text, const EditEncoding& encoding, qint64 offset)
{
    qint64 bytes = 0;
    int position = 0;
    while (position < text.size() && bytes < offset) {
        int consumed = 1;
        const QChar next = position + 1 < text.size() ? text.at(position + 1) : QChar();
        bytes += EncodedLength(text.at(position), next, encoding, &consumed);
        position += consumed;
    }
    return position;
}

qint64 ByteOffsetOfPosition(const QString& text, const EditEncoding& encoding, int position)
{
    qint64 bytes = 0;
    int at = 0;
    const int end = position < 0 ? 0 : (position > text.size() ? int(text.size()) : position);
    while (at < end) {
        int consumed = 1;
        const QChar next = at + 1 < text.size() ? text.at(at + 1) : QChar();
        bytes += EncodedLength(text.at(at), next, encoding, &consumed);
        at += consumed;
    }
    return bytes;
}

} // namespace ui
