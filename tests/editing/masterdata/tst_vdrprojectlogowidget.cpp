#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"
#include "editing/masterdata/VDRProjectLogoWidget.h"

#include <QComboBox>
#include <QDataStream>
#include <QImage>
#include <QLabel>
#include <QPushButton>
#include <QtTest>

#include <memory>

using namespace VDRTestFixtures;

class TestVDRProjectLogoWidget : public VDRTestCase
{
    Q_OBJECT

    void initRun() override;
    void initTest() override;
    void cleanupTest() override;

private slots:
    void insertAndRemove_data();
    void insertAndRemove();
    void badFiles_data();
    void badFiles();

private:
    QString row(const QString& sql) { return textsOn(m_doc->database(), sql).value(0); }
    void click(const QString& name) { m_widget->findChild<QPushButton*>(name)->click(); }

    std::unique_ptr<VDRDocument> m_doc;
    std::unique_ptr<VDRProjectLogoWidget> m_widget;
    QString m_logo;
};

void TestVDRProjectLogoWidget::initRun()
{
    QImage logo(300, 100, QImage::Format_RGB32);
    logo.fill(Qt::darkBlue);
    m_logo = m_dir.filePath("logo.png");
    QVERIFY(logo.save(m_logo));
}

void TestVDRProjectLogoWidget::initTest()
{
    m_doc = std::make_unique<VDRDocument>();
    QVERIFY(m_doc->createDocument(true));
    m_widget = std::make_unique<VDRProjectLogoWidget>();
    m_widget->slotDocumentOpened(m_doc.get());
    m_widget->show();
}

void TestVDRProjectLogoWidget::cleanupTest()
{
    m_widget.reset();
    m_doc.reset();
}

void TestVDRProjectLogoWidget::insertAndRemove_data()
{
    QTest::addColumn<QString>("suffix"); // "" first logo, "2" second
    QTest::addColumn<bool>("ok");
    QTest::newRow("first, OK") << "" << true;
    QTest::newRow("first, Abbrechen") << "" << false;
    QTest::newRow("second, OK") << "2" << true;
    QTest::newRow("second, Abbrechen") << "2" << false;
}

void TestVDRProjectLogoWidget::insertAndRemove()
{
    QFETCH(QString, suffix);
    QFETCH(bool, ok);
    const QString columns = suffix.isEmpty() ? "logo_image_id, logo_align" : "logo2_image_id, logo2_align";
    const QString before = row("SELECT " + columns + " FROM vdr");
    QCOMPARE(before, QString(suffix.isEmpty() ? "NULL|2" : "0|0"));

    m_prompt.expectFileName(m_logo);
    click("pbInsertLogo" + suffix);
    const int id = m_widget->logoImageId(suffix.isEmpty() ? 0 : 1);
    QVERIFY(id > 0);
    QVERIFY(!m_widget->findChild<QLabel*>("labelPreview" + suffix)->pixmap(Qt::ReturnByValue).isNull());
    m_widget->findChild<QComboBox*>("comboBoxAlign" + suffix)->setCurrentIndex(0); // "Links"
    click(ok ? "pbOk" : "pbCancel");

    const QString stored = QString::number(id) + "|1";
    QCOMPARE(row("SELECT " + columns + " FROM vdr"), ok ? stored : before);
    QCOMPARE(row(QString("SELECT count(*) FROM image WHERE id = %1").arg(id)), QString(ok ? "1" : "0"));
    if (!ok)
        return;

    // Removing it, then replacing it: only the picture in use stays, and only after OK.
    m_widget->show();
    click("pbRemoveLogo" + suffix);
    QVERIFY(!m_widget->findChild<QPushButton*>("pbRemoveLogo" + suffix)->isEnabled());
    click("pbCancel");
    QCOMPARE(row("SELECT " + columns + " FROM vdr"), stored);
    m_widget->show();
    m_prompt.expectFileName(m_logo);
    click("pbInsertLogo" + suffix);
    const int replacement = m_widget->logoImageId(suffix.isEmpty() ? 0 : 1);
    click("pbOk");
    QCOMPARE(row("SELECT group_concat(id) FROM image"), QString::number(replacement));
    m_widget->show();
    click("pbRemoveLogo" + suffix);
    click("pbOk");
    QCOMPARE(row("SELECT " + columns + " FROM vdr"), QString(suffix.isEmpty() ? "NULL|1" : "0|1"));
    QCOMPARE(row("SELECT count(*) FROM image"), QString("0"));
}

void TestVDRProjectLogoWidget::badFiles_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("message");
    // A BMP header declaring 12,000 x 12,000 pixels: refused before anything is decoded.
    QByteArray huge;
    QDataStream s(&huge, QIODevice::WriteOnly);
    s.setByteOrder(QDataStream::LittleEndian);
    s.writeRawData("BM", 2);
    s << quint32(54 + 12000u * 12000u * 3) << quint32(0) << quint32(54) << quint32(40) << qint32(12000)
      << qint32(12000) << quint16(1) << quint16(24) << quint32(0) << quint32(12000u * 12000u * 3)
      << qint32(2835) << qint32(2835) << quint32(0) << quint32(0);
    huge.append(QByteArray(1024, '\0'));
    QTest::newRow("not an image") << QByteArray("Kein Bild, nur Text.") << "ist kein Bild";
    QTest::newRow("12000 x 12000") << huge << "(12000 × 12000 Pixel) ist zu groß";
}

void TestVDRProjectLogoWidget::badFiles()
{
    QFETCH(QByteArray, content);
    QFETCH(QString, message);
    const QString path = m_dir.filePath("bad.png");
    QFile file(path);
    QVERIFY(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
    file.write(content);
    file.close();

    m_prompt.expectFileName(path);
    m_prompt.expect("Logo auswählen", message);
    click("pbInsertLogo");
    QCOMPARE(m_widget->logoImageId(0), -1);
    click("pbOk");
    QCOMPARE(row("SELECT logo_image_id FROM vdr"), QString("NULL"));
    QCOMPARE(row("SELECT count(*) FROM image"), QString("0"));
}

QTEST_MAIN(TestVDRProjectLogoWidget)
#include "tst_vdrprojectlogowidget.moc"
