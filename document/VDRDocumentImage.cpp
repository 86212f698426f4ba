// The image store: pictures of the diary as JPEG rows of the image table.
#include "document/VDRDocument.h"

#include <QBuffer>
#include <QDebug>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QGuiApplication>
#include <QImageReader>
#include <QImageWriter>
#include <QPainter>
#include <QSaveFile>
#include <QSettings>
#include <QSqlError>
#include <QSqlQuery>
#include <QTransform>

#include <libexif/exif-data.h>

#include <functional>
#include <memory>

namespace {

const int kThumbnailSize = 240;
const int kDefaultImageSize = 1000;
// Larger pictures are refused before decoding: 100 megapixels already need 400 MB as RGB32.
const qint64 kMaxPixels = 100LL * 1000 * 1000;

// Fits 'size' into a square of 'box' pixels, keeping the aspect ratio. Rounds instead of
// truncating, so that 600 x 400 becomes 1000 x 667.
QSize fittedSize(const QSize& size, int box)
{
    if (size.width() >= size.height())
        return QSize(box, qMax(1, qRound(double(size.height()) * box / size.width())));
    return QSize(qMax(1, qRound(double(size.width()) * box / size.height())), box);
}

QImage scaledTo(const QImage& image, const QSize& size)
{
    if (image.size() == size)
        return image;
    return image.scaled(size, Qt::IgnoreAspectRatio, Qt::SmoothTransformation);
}

int configuredImageSize()
{
    const int size = QSettings().value(VDRDocument::imageSizeSettingsKey(), kDefaultImageSize).toInt();
    return size > 0 ? size : kDefaultImageSize;
}

// JPEG knows no transparency; without this, transparent parts of a sketch or logo turn black.
QImage flattened(const QImage& image)
{
    if (!image.hasAlphaChannel())
        return image;
    QImage opaque(image.size(), QImage::Format_RGB32);
    opaque.fill(Qt::white);
    QPainter painter(&opaque);
    painter.drawImage(0, 0, image);
    painter.end();
    return opaque;
}

QByteArray encodeJpeg(const QImage& image)
{
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    QImageWriter writer(&buffer, "jpeg");
    writer.setQuality(100);
    if (!writer.write(flattened(image))) {
        qWarning() << "Encoding an image as JPEG failed:" << writer.errorString();
        return QByteArray();
    }
    return bytes;
}

// EXIF orientation 1 to 8, 1 when the file has none. The numeric value is compared rather than
// libexif's text form, which differs between libexif versions ("Right-top" against "right - top")
// and is translated to the user's language.
int exifOrientation(const QString& path)
{
    std::unique_ptr<ExifData, void (*)(ExifData*)> data(
        exif_data_new_from_file(QFile::encodeName(path).constData()), exif_data_unref);
    if (!data)
        return 1;
    ExifEntry* entry = exif_content_get_entry(data->ifd[EXIF_IFD_0], EXIF_TAG_ORIENTATION);
    if (!entry)
        entry = exif_data_get_entry(data.get(), EXIF_TAG_ORIENTATION);
    if (!entry || entry->format != EXIF_FORMAT_SHORT || entry->components < 1 || !entry->data ||
        entry->size < 2)
        return 1;
    return exif_get_short(entry->data, exif_data_get_byte_order(data.get()));
}

int rotationFor(int orientation)
{
    switch (orientation) {
    case 6: // right - top
        return 90;
    case 8: // left - bottom
        return 270;
    case 3: // bottom - right
        return 180;
    default:
        return 0;
    }
}

bool writeFile(const QString& path, const QByteArray& bytes)
{
    QSaveFile file(path);
    if (!file.open(QIODevice::WriteOnly) || file.write(bytes) != bytes.size() || !file.commit()) {
        qWarning() << "Writing" << path << "failed:" << file.errorString();
        return false;
    }
    return true;
}

// The temporary file of one image, written on first use and handed out again afterwards.
QString cachedTempFile(QMap<int, QString>& cache, const QString& folder, int id, const QString& fileName,
                       const std::function<QByteArray()>& load)
{
    const auto it = cache.constFind(id);
    // Rewritten only when someone removed it, so that a handed-out path always names a file.
    if (it != cache.constEnd() && QFileInfo::exists(it.value()))
        return it.value();
    if (folder.isEmpty())
        return QString();
    const QByteArray bytes = load();
    if (bytes.isEmpty())
        return QString();
    QDir().mkpath(folder);
    const QString path = QDir(folder).filePath(fileName);
    if (!writeFile(path, bytes)) {
        cache.remove(id);
        return QString();
    }
    cache.insert(id, path);
    return path;
}

// Inserts one row; the new id, or -1.
int insertImageRow(QSqlDatabase db, const QImage& image, const QImage& thumbnail)
{
    const QByteArray imageBytes = encodeJpeg(image);
    const QByteArray thumbnailBytes = encodeJpeg(thumbnail);
    if (imageBytes.isEmpty() || thumbnailBytes.isEmpty())
        return -1;
    QSqlQuery q(db);
    q.prepare(QStringLiteral(
        "INSERT INTO image (image, image_ct, image_width, image_height, thumbnail, thumbnail_ct, "
        "thumbnail_width, thumbnail_height) VALUES (:image, :image_ct, :image_width, :image_height, "
        ":thumbnail, :thumbnail_ct, :thumbnail_width, :thumbnail_height)"));
    q.bindValue(QStringLiteral(":image"), imageBytes);
    q.bindValue(QStringLiteral(":image_ct"), QStringLiteral("image/jpeg"));
    q.bindValue(QStringLiteral(":image_width"), image.width());
    q.bindValue(QStringLiteral(":image_height"), image.height());
    q.bindValue(QStringLiteral(":thumbnail"), thumbnailBytes);
    q.bindValue(QStringLiteral(":thumbnail_ct"), QStringLiteral("image/jpeg"));
    q.bindValue(QStringLiteral(":thumbnail_width"), thumbnail.width());
    q.bindValue(QStringLiteral(":thumbnail_height"), thumbnail.height());
    if (!q.exec()) {
        qWarning() << "Storing an image failed:" << q.lastError().text();
        return -1;
    }
    bool ok = false;
    const int id = q.lastInsertId().toInt(&ok);
    return ok ? id : -1;
}

QByteArray selectBlob(QSqlDatabase db, const QString& sql, int id)
{
    if (!db.isOpen())
        return QByteArray();
    QSqlQuery q(db);
    q.prepare(sql);
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec()) {
        qWarning() << "Reading an image failed:" << q.lastError().text();
        return QByteArray();
    }
    return q.next() ? q.value(0).toByteArray() : QByteArray();
}

bool guiAvailable()
{
    return qobject_cast<QGuiApplication*>(QCoreApplication::instance()) != nullptr;
}

} // namespace

int VDRDocument::createImage(const QString& path)
{
    if (!database().isOpen() || path.isEmpty())
        return -1;
    QImageReader reader(path);
    reader.setDecideFormatFromContent(true);
    // The EXIF orientation is applied below; Qt applying it as well would turn a photo twice.
    reader.setAutoTransform(false);
    if (!reader.canRead()) {
        qWarning() << "Not an image:" << path << reader.errorString();
        return -1;
    }
    const QSize declared = reader.size();
    if (declared.isValid() && declared.isEmpty()) {
        qWarning() << "Image refused, it has no pixels:" << path;
        return -1;
    }
    if (declared.isValid() && qint64(declared.width()) * declared.height() > kMaxPixels) {
        qWarning() << "Image refused: its size of" << declared.width() << "x" << declared.height()
                   << "pixels exceeds the limit of" << kMaxPixels << "pixels:" << path;
        return -1;
    }

    const int box = configuredImageSize();
    // A JPEG much larger than needed is decoded at a reduced scale by libjpeg itself, which saves
    // most of the memory and time; the smooth scaling below still sets the exact size.
    if (declared.isValid() && reader.format() == "jpeg") {
        const QSize reduced = fittedSize(declared, 2 * box);
        if (declared.width() > reduced.width() && declared.height() > reduced.height())
            reader.setScaledSize(reduced);
    }
    QImage image;
    if (!reader.read(&image) || image.isNull()) {
        qWarning() << "Reading the image failed:" << path << reader.errorString();
        return -1;
    }

    // The stored size follows from the declared size, so that reduced decoding changes no pixel count.
    QSize upright = declared.isValid() ? declared : image.size();
    const int degrees = rotationFor(exifOrientation(path));
    if (degrees != 0) {
        image = image.transformed(QTransform().rotate(degrees));
        if (degrees != 180)
            upright.transpose();
    }
    // Never distort: should the decoder have turned the picture after all, its own shape counts.
    if ((upright.width() >= upright.height()) != (image.width() >= image.height()))
        upright = image.size();
    const QImage fitted = scaledTo(image, fittedSize(upright, box));
    const int id =
        insertImageRow(database(), fitted, scaledTo(fitted, fittedSize(fitted.size(), kThumbnailSize)));
    if (id >= 0)
        setModified(true);
    return id;
}

int VDRDocument::createImage(const QImage& image)
{
    if (!database().isOpen() || image.isNull())
        return -1;
    const int id =
        insertImageRow(database(), image, scaledTo(image, fittedSize(image.size(), kThumbnailSize)));
    if (id >= 0)
        setModified(true);
    return id;
}

int VDRDocument::createImage(const QPixmap& pixmap)
{
    return createImage(pixmap.toImage());
}

bool VDRDocument::exchangeImage(int id, const QImage& image, bool fit)
{
    if (!database().isOpen() || image.isNull())
        return false;
    const QImage stored = fit ? scaledTo(image, fittedSize(image.size(), configuredImageSize())) : image;
    const QImage thumbnail = scaledTo(stored, fittedSize(stored.size(), kThumbnailSize));
    const QByteArray imageBytes = encodeJpeg(stored);
    const QByteArray thumbnailBytes = encodeJpeg(thumbnail);
    if (imageBytes.isEmpty() || thumbnailBytes.isEmpty())
        return false;
    QSqlQuery q(database());
    q.prepare(QStringLiteral(
        "UPDATE image SET image = :image, image_width = :image_width, image_height = :image_height, "
        "thumbnail = :thumbnail, thumbnail_ct = :thumbnail_ct, thumbnail_width = :thumbnail_width, "
        "thumbnail_height = :thumbnail_height WHERE id = :id"));
    q.bindValue(QStringLiteral(":image"), imageBytes);
    q.bindValue(QStringLiteral(":image_width"), stored.width());
    q.bindValue(QStringLiteral(":image_height"), stored.height());
    q.bindValue(QStringLiteral(":thumbnail"), thumbnailBytes);
    q.bindValue(QStringLiteral(":thumbnail_ct"), QStringLiteral("image/jpeg"));
    q.bindValue(QStringLiteral(":thumbnail_width"), thumbnail.width());
    q.bindValue(QStringLiteral(":thumbnail_height"), thumbnail.height());
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec()) {
        qWarning() << "Replacing image" << id << "failed:" << q.lastError().text();
        return false;
    }
    if (q.numRowsAffected() < 1)
        return false;
    setModified(true);
    // Files already handed out must not keep showing the old picture (a turned photo, an edited sketch).
    if (m_imageTempPaths.contains(id) && !writeFile(m_imageTempPaths.value(id), imageBytes))
        m_imageTempPaths.remove(id);
    if (m_thumbnailTempPaths.contains(id) && !writeFile(m_thumbnailTempPaths.value(id), thumbnailBytes))
        m_thumbnailTempPaths.remove(id);
    return true;
}

bool VDRDocument::exchangeImage(int id, const QPixmap& pixmap, bool fit)
{
    return exchangeImage(id, pixmap.toImage(), fit);
}

QByteArray VDRDocument::getImageData(int id)
{
    return selectBlob(database(), QStringLiteral("SELECT image FROM image WHERE id = :id"), id);
}

QByteArray VDRDocument::getImageThumbnailData(int id)
{
    return selectBlob(database(), QStringLiteral("SELECT thumbnail FROM image WHERE id = :id"), id);
}

QImage VDRDocument::getImage(int id)
{
    return QImage::fromData(getImageData(id));
}

QImage VDRDocument::getImageThumbnail(int id)
{
    return QImage::fromData(getImageThumbnailData(id));
}

// Pixmaps need a QGuiApplication; the command-line tool has none and gets a null pixmap.
QPixmap VDRDocument::getImagePixmap(int id)
{
    return guiAvailable() ? QPixmap::fromImage(getImage(id)) : QPixmap();
}

QPixmap VDRDocument::getImageThumbnailPixmap(int id)
{
    return guiAvailable() ? QPixmap::fromImage(getImageThumbnail(id)) : QPixmap();
}

bool VDRDocument::getImageMetadata(int id, QMap<QString, QVariant>& metadata)
{
    if (!database().isOpen())
        return false;
    QSqlQuery q(database());
    q.prepare(QStringLiteral("SELECT image_ct, image_width, image_height, thumbnail_ct, thumbnail_width, "
                             "thumbnail_height FROM image WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec()) {
        qWarning() << "Reading the metadata of image" << id << "failed:" << q.lastError().text();
        return false;
    }
    if (!q.next())
        return false;
    const QStringList keys = {QStringLiteral("image_ct"),        QStringLiteral("image_width"),
                              QStringLiteral("image_height"),    QStringLiteral("thumbnail_ct"),
                              QStringLiteral("thumbnail_width"), QStringLiteral("thumbnail_height")};
    for (int i = 0; i < keys.size(); ++i)
        metadata.insert(keys.at(i), q.value(i));
    return true;
}

bool VDRDocument::exportImage(int id, const QString& path)
{
    const QByteArray bytes = getImageData(id);
    if (bytes.isEmpty() || path.isEmpty())
        return false;
    // A JPEG target gets the stored bytes as they are: decoding and encoding again would lose quality.
    const QString suffix = QFileInfo(path).suffix().toLower();
    if (suffix == QLatin1String("jpg") || suffix == QLatin1String("jpeg"))
        return writeFile(path, bytes);
    const QImage image = QImage::fromData(bytes);
    if (image.isNull() || !image.save(path)) {
        qWarning() << "Exporting image" << id << "to" << path << "failed";
        return false;
    }
    return true;
}

QString VDRDocument::getImageTempPath(int id)
{
    return cachedTempFile(m_imageTempPaths, m_tempFolder, id, QStringLiteral("image-%1.jpg").arg(id),
                          [this, id] { return getImageData(id); });
}

QString VDRDocument::getImageThumbnailTempPath(int id)
{
    return cachedTempFile(m_thumbnailTempPaths, m_tempFolder, id,
                          QStringLiteral("image-%1-thumbnail.jpg").arg(id),
                          [this, id] { return getImageThumbnailData(id); });
}

QString VDRDocument::getImageTempPath4Upload(int id)
{
    const QString path = getImageTempPath(id);
    if (!path.isEmpty() && !m_uploadImages.contains(path))
        m_uploadImages.append(path);
    return path;
}

QString VDRDocument::getImageThumbnailTempPath4Upload(int id)
{
    const QString path = getImageThumbnailTempPath(id);
    if (!path.isEmpty() && !m_uploadImages.contains(path))
        m_uploadImages.append(path);
    return path;
}

QList<int> VDRDocument::getImageIds()
{
    QList<int> ids;
    if (!database().isOpen())
        return ids;
    QSqlQuery q(database());
    if (!q.exec(QStringLiteral("SELECT id FROM image"))) {
        qWarning() << "Reading the image ids failed:" << q.lastError().text();
        return ids;
    }
    while (q.next())
        ids.append(q.value(0).toInt());
    return ids;
}

// -1 when the count cannot be read: a caller must not take that for "unused" and delete the image.
int VDRDocument::countImageAccess(int id)
{
    if (!database().isOpen())
        return -1;
    QSqlQuery q(database());
    q.prepare(
        QStringLiteral("SELECT count(photo_image_id) FROM entry_photo WHERE photo_image_id = :imageID"));
    q.bindValue(QStringLiteral(":imageID"), id);
    if (!q.exec() || !q.next()) {
        qWarning() << "Counting the uses of image" << id << "failed:" << q.lastError().text();
        return -1;
    }
    return q.value(0).toInt();
}

bool VDRDocument::deleteImage(int id)
{
    if (!database().isOpen())
        return false;
    QSqlQuery q(database());
    q.prepare(QStringLiteral("DELETE FROM image WHERE id = :id"));
    q.bindValue(QStringLiteral(":id"), id);
    if (!q.exec()) {
        qWarning() << "Deleting image" << id << "failed:" << q.lastError().text();
        return false;
    }
    // Ids are never reused, but a handed-out file of a deleted image must not be offered again.
    for (QMap<int, QString>* cache : {&m_imageTempPaths, &m_thumbnailTempPaths}) {
        const QString file = cache->take(id);
        if (!file.isEmpty()) {
            m_uploadImages.removeAll(file);
            QFile::remove(file);
        }
    }
    if (q.numRowsAffected() < 1)
        return false;
    setModified(true);
    return true;
}
