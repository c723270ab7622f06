#include "ui/qt/EditText.h"

#include <QStringDecoder>
#include <QStringEncoder>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

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

bool IsLineBreak(char16_t c, bool documentBreaks)
{
    return c == u'\n' ||
           (documentBreaks && (c == QChar::ParagraphSeparator || c == QChar::LineSeparator));
}

// Where the next line break is, from from on; the text's size when there is none. Eight
// characters a step where the processor allows: a script's lines are long enough for it.
qsizetype NextLineBreak(QStringView text, qsizetype from, bool documentBreaks)
{
    const char16_t* data = text.utf16();
    const qsizetype size = text.size();
    qsizetype i = from;
#if defined(__SSE2__)
    const __m128i lineFeed = _mm_set1_epi16('\n');
    // U+2028 and U+2029 differ in the lowest bit only.
    const __m128i separatorBits = _mm_set1_epi16(static_cast<short>(0xFFFE));
    const __m128i separator = _mm_set1_epi16(static_cast<short>(QChar::LineSeparator));
    for (; i + 8 <= size; i += 8) {
        const __m128i chunk = _mm_loadu_si128(reinterpret_cast<const __m128i*>(data + i));
        __m128i hits = _mm_cmpeq_epi16(chunk, lineFeed);
        if (documentBreaks) {
            hits =
                _mm_or_si128(hits, _mm_cmpeq_epi16(_mm_and_si128(chunk, separatorBits), separator));
        }
        const int mask = _mm_movemask_epi8(hits);
        if (mask != 0)
            return i + __builtin_ctz(static_cast<unsigned>(mask)) / 2;
    }
#endif
    for (; i < size; ++i) {
        if (IsLineBreak(data[i], documentBreaks))
            return i;
    }
    return size;
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

QByteArray EncodeEditText(QStringView text, const EditEncoding& encoding, bool documentBreaks)
{
    // A character outside Latin-1 typed into a Latin-1 text cannot be written as one byte;
    // it becomes '?', as a code-page conversion would make it. Stateless: each line is
    // encoded as a whole text would be, and no surrogate pair spans a line break.
    QStringEncoder encoder(encoding.latin1 ? QStringEncoder::Latin1 : QStringEncoder::Utf8,
                           QStringEncoder::Flag::Stateless);
    // Enough for the worst case: UTF-8 takes at most three bytes a character, which covers
    // a CR LF too; Latin-1 takes one, and a CR LF one more.
    QByteArray bytes(encoder.requiredSpace(text.size()) + (encoding.crlf ? text.size() : 0),
                     Qt::Uninitialized);
    char* out = bytes.data();
    qsizetype lineStart = 0;
    for (;;) {
        const qsizetype lineBreak = NextLineBreak(text, lineStart, documentBreaks);
        out = encoder.appendToBuffer(out, text.sliced(lineStart, lineBreak - lineStart));
        if (lineBreak == text.size())
            break;
        if (encoding.crlf)
            *out++ = '\r';
        *out++ = '\n';
        lineStart = lineBreak + 1;
    }
    bytes.truncate(out - bytes.constData());
    return bytes;
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
