#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"

#include <QBuffer>
#include <QDir>
#include <QSettings>
#include <QSqlQuery>
#include <QtTest>

#include <libexif/exif-data.h>

#include <memory>

namespace {
const QColor kMarker(Qt::red);

// White (or transparent) picture with a red marker in its top-left corner.
QImage picture(const QSize& size, bool transparent = false)
{
    QImage image(size, QImage::Format_ARGB32);
    image.fill(transparent ? Qt::transparent : Qt::white);
    const int w = size.width() / 5, h = size.height() / 5;
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x)
            image.setPixelColor(x, y, kMarker);
    return image;
}

bool near(const QColor& a, const QColor& b)
{
    return qAbs(a.red() - b.red()) < 40 && qAbs(a.green() - b.green()) < 40 && qAbs(a.blue() - b.blue()) < 40;
}

// The marker sits top-left and nowhere else, the rest is white.
bool upright(const QImage& image)
{
    const int dx = image.width() / 20, dy = image.height() / 20;
    const int r = image.width() - 1 - dx, b = image.height() - 1 - dy;
    return near(image.pixelColor(dx, dy), kMarker) && near(image.pixelColor(r, dy), Qt::white) &&
           near(image.pixelColor(dx, b), Qt::white) && near(image.pixelColor(r, b), Qt::white);
}

QByteArray jpeg(const QImage& image, int quality = 90)
{
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "JPG", quality);
    return bytes;
}

// An APP1 segment with an EXIF Orientation tag, placed right after the JPEG's SOI marker.
QByteArray withOrientation(QByteArray jpegBytes, int orientation)
{
    ExifData* exif = exif_data_new();
    exif_data_set_byte_order(exif, EXIF_BYTE_ORDER_MOTOROLA);
    ExifEntry* entry = exif_entry_new();
    exif_content_add_entry(exif->ifd[EXIF_IFD_0], entry);
    exif_entry_initialize(entry, EXIF_TAG_ORIENTATION);
    exif_set_short(entry->data, EXIF_BYTE_ORDER_MOTOROLA, ExifShort(orientation));
    unsigned char* data = nullptr;
    unsigned int size = 0;
    exif_data_save_data(exif, &data, &size); // starts with "Exif\0\0"
    QByteArray segment("\xFF\xE1", 2);
    segment.append(char((size + 2) >> 8)).append(char((size + 2) & 0xFF));
    segment.append(reinterpret_cast<const char*>(data), int(size));
    free(data);
    exif_entry_unref(entry);
    exif_data_unref(exif);
    return jpegBytes.insert(2, segment);
}

// A small JPEG whose frame header claims another size.
QByteArray claimingSize(int width, int height)
{
    QByteArray bytes = jpeg(picture(QSize(64, 64)));
    const int sof = bytes.indexOf(QByteArray("\xFF\xC0", 2));
    bytes[sof + 5] = char(height >> 8);
    bytes[sof + 6] = char(height & 0xFF);
    bytes[sof + 7] = char(width >> 8);
    bytes[sof + 8] = char(width & 0xFF);
    return bytes;
}

// Decoded pictures and the row's metadata agree on the expected sizes.
void verifyStored(VDRDocument& doc, int id, const QSize& stored, const QSize& thumbnail)
{
    QCOMPARE(doc.getImage(id).size(), stored);
    QCOMPARE(doc.getImageThumbnail(id).size(), thumbnail);
    QMap<QString, QVariant> m;
    QVERIFY(doc.getImageMetadata(id, m));
    QCOMPARE(m.value("image_ct").toString(), QStringLiteral("image/jpeg"));
    QCOMPARE(m.value("thumbnail_ct").toString(), QStringLiteral("image/jpeg"));
    QCOMPARE(QSize(m.value("image_width").toInt(), m.value("image_height").toInt()), stored);
    QCOMPARE(QSize(m.value("thumbnail_width").toInt(), m.value("thumbnail_height").toInt()), thumbnail);
}
} // namespace

class TestVDRImageStore : public VDRTestCase
{
    Q_OBJECT
    std::unique_ptr<VDRDocument> m_doc;

    QString fixture(const QString& name, const QByteArray& bytes)
    {
        const QString path = m_dir.filePath(name);
        return VDRTestFixtures::writeFile(path, bytes) ? path : QString();
    }

    // Every test works on a new diary of its own.
    void initTest() override
    {
        QSettings().remove(VDRDocument::imageSizeSettingsKey());
        m_doc = std::make_unique<VDRDocument>();
        QVERIFY(m_doc->createDocument(true));
    }
    void cleanupTest() override
    {
        if (m_doc->isStateValid())
            QVERIFY(m_doc->closeDocument());
        m_doc.reset();
    }

private slots:
    void photoIsFittedAndTurnedUpright_data()
    {
        QTest::addColumn<QSize>("uprightSize");
        QTest::addColumn<int>("orientation"); // 0 = no EXIF block
        QTest::addColumn<int>("imageSize");   // 0 = the default setting
        QTest::addColumn<QSize>("stored");
        QTest::addColumn<QSize>("thumbnail");
        const QSize portrait(3000, 4000), stored(750, 1000), thumb(180, 240);
        QTest::newRow("4000x3000 shrinks")
            << QSize(4000, 3000) << 0 << 0 << QSize(1000, 750) << QSize(240, 180);
        QTest::newRow("600x400 grows") << QSize(600, 400) << 0 << 0 << QSize(1000, 667) << QSize(240, 160);
        QTest::newRow("custom size 500")
            << QSize(4000, 3000) << 0 << 500 << QSize(500, 375) << QSize(240, 180);
        QTest::newRow("orientation 1") << portrait << 1 << 0 << stored << thumb;
        QTest::newRow("orientation 3") << portrait << 3 << 0 << stored << thumb;
        QTest::newRow("orientation 6") << portrait << 6 << 0 << stored << thumb;
        QTest::newRow("orientation 8") << portrait << 8 << 0 << stored << thumb;
        QTest::newRow("orientation 6 landscape")
            << QSize(600, 400) << 6 << 0 << QSize(1000, 667) << QSize(240, 160);
    }
    void photoIsFittedAndTurnedUpright()
    {
        QFETCH(QSize, uprightSize);
        QFETCH(int, orientation);
        QFETCH(int, imageSize);
        QFETCH(QSize, stored);
        QFETCH(QSize, thumbnail);
        if (imageSize > 0)
            QSettings().setValue(VDRDocument::imageSizeSettingsKey(), imageSize);
        // The camera stores the pixels turned against the view; the tag says how to turn them back.
        const int turnBack = orientation == 6 ? 90 : orientation == 8 ? 270 : orientation == 3 ? 180 : 0;
        QByteArray bytes = jpeg(picture(uprightSize).transformed(QTransform().rotate(-turnBack)));
        if (orientation > 0)
            bytes = withOrientation(bytes, orientation);
        const QString path = fixture(QStringLiteral("photo.jpg"), bytes);

        VDRDocument& doc = *m_doc;
        const int id = doc.createImage(path);
        QVERIFY(id > 0);
        QVERIFY(doc.isStateModified());
        verifyStored(doc, id, stored, thumbnail);
        QVERIFY2(upright(doc.getImage(id)), "the marker is not in the top-left corner");
        QVERIFY(upright(doc.getImageThumbnail(id)));
    }

    void unusableFiles_data()
    {
        QTest::addColumn<QByteArray>("bytes");
        QTest::addColumn<QString>("warning"); // our own warning that must be shown, or empty
        QTest::addColumn<QSize>("stored");    // invalid = nothing is stored
        const QByteArray photo = jpeg(picture(QSize(4000, 3000)));
        const QString limit = QStringLiteral("exceeds the limit");
        QTest::newRow("text") << QByteArray("no picture here\n") << QString() << QSize();
        QTest::newRow("empty") << QByteArray() << QString() << QSize();
        QTest::newRow("cut in the header") << photo.left(40) << QString() << QSize();
        QTest::newRow("claims 60000x60000") << claimingSize(60000, 60000) << limit << QSize();
        QTest::newRow("claims 11000x10000") << claimingSize(11000, 10000) << limit << QSize();
        // What libjpeg decodes of a cut photo is kept: the user sees the damage and can remove it.
        QTest::newRow("cut in the scan") << photo.left(photo.size() / 2) << QString() << QSize(1000, 750);
    }
    void unusableFiles()
    {
        QFETCH(QByteArray, bytes);
        QFETCH(QString, warning);
        QFETCH(QSize, stored);
        const QString path = fixture(QStringLiteral("unusable.jpg"), bytes);
        VDRDocument& doc = *m_doc;
        if (!warning.isEmpty())
            QTest::ignoreMessage(QtWarningMsg, QRegularExpression(warning));
        const int id = doc.createImage(path);
        if (stored.isValid()) {
            QVERIFY(id > 0);
            QCOMPARE(doc.getImage(id).size(), stored);
        } else {
            QCOMPARE(id, -1);
            QVERIFY(doc.getImageIds().isEmpty());
        }
        QCOMPARE(doc.createImage(m_dir.filePath(QStringLiteral("missing.jpg"))), -1);
    }

    void picturesKeepTheirSize_data()
    {
        QTest::addColumn<bool>("exchange"); // replace a stored picture instead of creating one
        QTest::addColumn<bool>("fit");
        QTest::addColumn<QSize>("size");
        QTest::addColumn<QSize>("stored");
        QTest::addColumn<QSize>("thumbnail");
        QTest::newRow("create 800x600")
            << false << false << QSize(800, 600) << QSize(800, 600) << QSize(240, 180);
        QTest::newRow("create 100x50")
            << false << false << QSize(100, 50) << QSize(100, 50) << QSize(240, 120);
        QTest::newRow("exchange") << true << false << QSize(1600, 1200) << QSize(1600, 1200)
                                  << QSize(240, 180);
        QTest::newRow("exchange fitted")
            << true << true << QSize(1600, 1200) << QSize(1000, 750) << QSize(240, 180);
        QTest::newRow("exchange fitted up")
            << true << true << QSize(300, 600) << QSize(500, 1000) << QSize(120, 240);
    }
    void picturesKeepTheirSize()
    {
        QFETCH(bool, exchange);
        QFETCH(bool, fit);
        QFETCH(QSize, size);
        QFETCH(QSize, stored);
        QFETCH(QSize, thumbnail);
        VDRDocument& doc = *m_doc;
        // Transparent like a sketch: JPEG has no alpha, the background must come out white, not black.
        const QImage sketch = picture(size, true);
        const int id = doc.createImage(exchange ? picture(QSize(40, 30)) : sketch);
        QVERIFY(id > 0);
        if (exchange)
            QVERIFY(doc.exchangeImage(id, sketch, fit));
        QCOMPARE(doc.getImageIds(), QList<int>{id});
        verifyStored(doc, id, stored, thumbnail);
        QVERIFY(upright(doc.getImage(id)));
        QVERIFY(!doc.exchangeImage(id + 1, sketch, fit));
        QCOMPARE(doc.createImage(QImage()), -1);
    }

    void exportImage_data()
    {
        QTest::addColumn<QString>("fileName");
        QTest::addColumn<bool>("written");
        QTest::newRow("png") << "export.png" << true;
        QTest::newRow("jpg") << "export.jpg" << true;
        QTest::newRow("unknown format") << "export.xyz" << false;
    }
    void exportImage()
    {
        QFETCH(QString, fileName);
        QFETCH(bool, written);
        VDRDocument& doc = *m_doc;
        const int id = doc.createImage(picture(QSize(320, 200)));
        QVERIFY(id > 0);
        const QString path = m_dir.filePath(fileName);
        QFile::remove(path);
        QCOMPARE(doc.exportImage(id, path), written);
        QCOMPARE(QFile::exists(path), written);
        if (written) {
            const QImage exported(path);
            QCOMPARE(exported.size(), QSize(320, 200));
            QVERIFY(upright(exported));
        }
        QVERIFY(!doc.exportImage(id + 1, m_dir.filePath(QStringLiteral("none.png"))));
    }

    void rowsAreCountedAndDeleted()
    {
        VDRDocument& doc = *m_doc;
        const int used = doc.createImage(picture(QSize(64, 48)));
        const int unused = doc.createImage(picture(QSize(48, 64)));
        QVERIFY(used > 0 && unused > used);
        QCOMPARE(doc.getImageIds(), (QList<int>{used, unused}));
        QSqlQuery q(doc.database());
        for (int photo : {1001, 1002})
            QVERIFY(
                q.exec(QStringLiteral(
                           "INSERT INTO entry_photo (id, entry_id, pos, type, photo_image_id, caption, "
                           "comment, date, relation_id) VALUES (%1, 1, 0, 1, %2, 'c', ' ', '2024-01-02', -1)")
                           .arg(photo)
                           .arg(used)));
        QCOMPARE(doc.countImageAccess(used), 2);
        QCOMPARE(doc.countImageAccess(unused), 0);

        QVERIFY(doc.deleteImage(unused));
        QCOMPARE(doc.getImageIds(), QList<int>{used});
        QVERIFY(doc.getImageData(unused).isNull());
        QVERIFY(doc.getImageThumbnailData(unused).isNull());
        QMap<QString, QVariant> metadata;
        QVERIFY(!doc.getImageMetadata(unused, metadata));
        QVERIFY(!doc.deleteImage(unused));
        // A new image never takes the id of a deleted one.
        QVERIFY(doc.createImage(picture(QSize(10, 10))) > unused);
    }

    void temporaryFilesAreWrittenOncePerOpening()
    {
        VDRDocument& doc = *m_doc;
        const int id = doc.createImage(picture(QSize(400, 300)));
        QVERIFY(id > 0);
        const QDir folder(doc.temporaryFolder());
        const QString image = doc.getImageTempPath(id);
        const QString thumbnail = doc.getImageThumbnailTempPath(id);
        QCOMPARE(image, folder.filePath(QStringLiteral("image-%1.jpg").arg(id)));
        QCOMPARE(thumbnail, folder.filePath(QStringLiteral("image-%1-thumbnail.jpg").arg(id)));
        auto contents = [](const QString& path) {
            QFile f(path);
            return f.open(QIODevice::ReadOnly) ? f.readAll() : QByteArray();
        };
        QCOMPARE(contents(image), doc.getImageData(id));
        QCOMPARE(contents(thumbnail), doc.getImageThumbnailData(id));

        // Asked again, the file is handed out as it is, not written a second time.
        QVERIFY(VDRTestFixtures::writeFile(image, "marked"));
        QCOMPARE(doc.getImageTempPath(id), image);
        QCOMPARE(contents(image), QByteArray("marked"));
        // Removed by someone else, it is written again so that the path names a file.
        QVERIFY(QFile::remove(thumbnail));
        QCOMPARE(doc.getImageThumbnailTempPath(id), thumbnail);
        QCOMPARE(contents(thumbnail), doc.getImageThumbnailData(id));
        // A replaced picture does not leave the old one in files already handed out.
        QVERIFY(doc.exchangeImage(id, picture(QSize(200, 300)), false));
        QCOMPARE(contents(image), doc.getImageData(id));
        QCOMPARE(contents(thumbnail), doc.getImageThumbnailData(id));

        QVERIFY(doc.getImageTempPath(id + 1).isEmpty());
        QVERIFY(doc.getImageThumbnailTempPath(id + 1).isEmpty());
        QVERIFY(doc.deleteImage(id));
        QVERIFY(doc.getImageTempPath(id).isEmpty());
        QVERIFY(!QFile::exists(image));
    }

    void uploadListAndClosing()
    {
        VDRDocument& doc = *m_doc;
        const int first = doc.createImage(picture(QSize(400, 300)));
        const int second = doc.createImage(picture(QSize(300, 400)));
        QVERIFY(first > 0 && second > first);
        const QString shown = doc.getImageTempPath(second);
        QVERIFY(doc.getListOfUploadImages().isEmpty());
        const QString image = doc.getImageTempPath4Upload(first);
        const QString thumbnail = doc.getImageThumbnailTempPath4Upload(first);
        QCOMPARE(image, doc.getImageTempPath(first));
        QCOMPARE(doc.getImageTempPath4Upload(first), image); // listed once
        QVERIFY(doc.getImageTempPath4Upload(second + 1).isEmpty());
        QCOMPARE(doc.getListOfUploadImages(), (QStringList{image, thumbnail}));
        doc.clearListOfUploadImages();
        QVERIFY(doc.getListOfUploadImages().isEmpty());

        QCOMPARE(doc.getImageTempPath4Upload(second), shown);
        const QString folder = doc.temporaryFolder();
        QVERIFY(doc.closeDocument());
        for (const QString& path : {image, thumbnail, shown})
            QVERIFY2(!QFile::exists(path), qPrintable(path));
        QVERIFY(!QDir(folder).exists());
        QVERIFY(doc.getListOfUploadImages().isEmpty());
        QVERIFY(doc.getImageTempPath(first).isEmpty());
    }
};

QTEST_GUILESS_MAIN(TestVDRImageStore)
#include "tst_vdrimagestore.moc"
