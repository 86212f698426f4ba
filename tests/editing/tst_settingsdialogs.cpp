#include "VDRTestFixtures.h"
#include "editing/VDRBackupConfigDialog.h"
#include "editing/VDRFileSizeConfigDialog.h"

#include <QPushButton>
#include <QSettings>
#include <QSpinBox>
#include <QTemporaryDir>
#include <QtTest>

#include <memory>

class TestSettingsDialogs : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void storesOnlyOnOk_data();
    void storesOnlyOnOk();

private:
    QTemporaryDir m_dir;
};

void TestSettingsDialogs::initTestCase()
{
    QVERIFY(m_dir.isValid());
    VDRTestFixtures::isolateSettings(m_dir.path());
}

void TestSettingsDialogs::storesOnlyOnOk_data()
{
    QTest::addColumn<QString>("dialog");
    QTest::addColumn<QString>("key");
    QTest::addColumn<int>("defaultValue");
    QTest::addColumn<int>("maximum");
    QTest::addColumn<int>("step");
    QTest::newRow("backups") << "backup"
                             << "file/NumberOfBackups" << 4 << 25 << 1;
    QTest::newRow("file size") << "filesize"
                               << "file/FileSize" << 100 << 2000 << 10;
}

void TestSettingsDialogs::storesOnlyOnOk()
{
    QFETCH(QString, dialog);
    QFETCH(QString, key);
    QFETCH(int, defaultValue);
    QFETCH(int, maximum);
    QFETCH(int, step);
    auto make = [&]() -> std::unique_ptr<QDialog> {
        if (dialog == QLatin1String("backup"))
            return std::make_unique<VDRBackupConfigDialog>();
        return std::make_unique<VDRFileSizeConfigDialog>();
    };
    auto click = [](QDialog* d, const char* name) {
        d->findChild<QPushButton*>(QLatin1String(name))->click();
    };

    QSettings().remove(key);
    std::unique_ptr<QDialog> d = make();
    auto* spin = d->findChild<QSpinBox*>(QStringLiteral("spinBox"));
    QVERIFY(spin);
    QCOMPARE(spin->maximum(), maximum);
    QCOMPARE(spin->singleStep(), step);
    d->show();
    QCOMPARE(spin->value(), defaultValue); // nothing stored yet

    spin->setValue(7 * step);
    click(d.get(), "pushButtonCancel");
    QVERIFY(!QSettings().contains(key));

    d = make();
    spin = d->findChild<QSpinBox*>(QStringLiteral("spinBox"));
    d->show();
    spin->setValue(7 * step);
    click(d.get(), "pushButtonOk");
    QCOMPARE(QSettings().value(key).toInt(), 7 * step);

    // Shown again, it reads the stored value; the defaults button only changes the field.
    d = make();
    spin = d->findChild<QSpinBox*>(QStringLiteral("spinBox"));
    d->show();
    QCOMPARE(spin->value(), 7 * step);
    click(d.get(), "pushButtonDefaults");
    QCOMPARE(spin->value(), defaultValue);
    QCOMPARE(QSettings().value(key).toInt(), 7 * step);
    click(d.get(), "pushButtonOk");
    QCOMPARE(QSettings().value(key).toInt(), defaultValue);
}

QTEST_MAIN(TestSettingsDialogs)
#include "tst_settingsdialogs.moc"
