#include "document/VDRRichTextResources.h"

#include <QBuffer>
#include <QImage>
#include <QImageReader>
#include <QTextBlock>
#include <QTextDocument>
#include <QTextFragment>
#include <QUrl>

namespace {
// A picture in a text is never a camera original; this bounds what one can cost to decode.
const qint64 kMaxPixels = 25LL * 1000 * 1000;

QImage decodeDataUrl(const QUrl& url)
{
    if (url.scheme() != QLatin1String("data"))
        return QImage();
    const QString path = url.path(QUrl::FullyDecoded);
    const int comma = path.indexOf(QLatin1Char(','));
    if (comma < 0)
        return QImage();
    const QByteArray payload = path.mid(comma + 1).toLatin1();
    const QByteArray bytes = path.left(comma).endsWith(QLatin1String(";base64"), Qt::CaseInsensitive)
                                 ? QByteArray::fromBase64(payload)
                                 : payload;
    QBuffer buffer;
    buffer.setData(bytes);
    buffer.open(QIODevice::ReadOnly);
    QImageReader reader(&buffer);
    const QSize size = reader.size();
    QImage image;
    if (!size.isValid() || qint64(size.width()) * size.height() > kMaxPixels || !reader.read(&image))
        return QImage();
    return image;
}

// Stands for a picture that is not shown: small, grey, visibly a gap.
QImage missingPicture()
{
    QImage image(16, 16, QImage::Format_RGB32);
    image.fill(Qt::lightGray);
    return image;
}
} // namespace

void VDRRichTextResources::guard(QTextDocument* document, const QString& html)
{
    if (!document)
        return;
    // Read without a layout, so that nothing asks for the pictures yet.
    QTextDocument scratch;
    scratch.setHtml(html);
    for (QTextBlock block = scratch.begin(); block.isValid(); block = block.next()) {
        for (auto it = block.begin(); !it.atEnd(); ++it) {
            const QTextFragment fragment = it.fragment();
            if (!fragment.isValid() || !fragment.charFormat().isImageFormat())
                continue;
            QString name = fragment.charFormat().toImageFormat().name();
            if (name.startsWith(QLatin1String(":/")))
                name.prepend(QLatin1String("qrc"));
            const QUrl url(name);
            const QImage image = decodeDataUrl(url);
            document->addResource(QTextDocument::ImageResource, url,
                                  image.isNull() ? missingPicture() : image);
        }
    }
}
