#include "VDRTestCase.h"
#include "editing/VDRWidgetPrompt.h"
#include "editing/settings/VDRBackupConfigDialog.h"
#include "editing/settings/VDRFileSizeConfigDialog.h"

#include <QProgressDialog>
#include <QPushButton>
#include <QSettings>
#include <QSpinBox>
#include <QtTest>

#include <memory>

class TestSettingsDialogs : public VDRTestCase
{
    Q_OBJECT

private slots:
    void storesOnlyOnOk_data()
    {
        QTest::addColumn<QString>("dialog");
        QTest::addColumn<QString>("key");
        QTest::addColumn<int>("defaultValue");
        QTest::addColumn<int>("maximum");
        QTest::addColumn<int>("step");
        QTest::newRow("backups") << QStringLiteral("backup") << "file/NumberOfBackups" << 4 << 25 << 1;
        QTest::newRow("file size") << QStringLiteral("filesize") << "file/FileSize" << 100 << 2000 << 10;
    }

    void storesOnlyOnOk()
    {
        QFETCH(QString, dialog);
        QFETCH(QString, key);
        QFETCH(int, defaultValue);
        QFETCH(int, maximum);
        QFETCH(int, step);
        std::unique_ptr<QDialog> d;
        QSpinBox* spin = nullptr;
        auto show = [&] {
            if (dialog == QLatin1String("backup"))
                d = std::make_unique<VDRBackupConfigDialog>();
            else
                d = std::make_unique<VDRFileSizeConfigDialog>();
            spin = d->findChild<QSpinBox*>(QStringLiteral("spinBox"));
            d->show();
            return spin != nullptr;
        };
        auto click = [&d](const char* name) { d->findChild<QPushButton*>(QLatin1String(name))->click(); };

        QSettings().remove(key);
        QVERIFY(show());
        QCOMPARE(spin->maximum(), maximum);
        QCOMPARE(spin->singleStep(), step);
        QCOMPARE(spin->value(), defaultValue); // nothing stored yet
        spin->setValue(7 * step);
        click("pushButtonCancel");
        QVERIFY(!QSettings().contains(key));

        QVERIFY(show());
        spin->setValue(7 * step);
        click("pushButtonOk");
        QCOMPARE(QSettings().value(key).toInt(), 7 * step);

        // Shown again, it reads the stored value; the defaults button only changes the field.
        QVERIFY(show());
        QCOMPARE(spin->value(), 7 * step);
        click("pushButtonDefaults");
        QCOMPARE(spin->value(), defaultValue);
        QCOMPARE(QSettings().value(key).toInt(), 7 * step);
        click("pushButtonOk");
        QCOMPARE(QSettings().value(key).toInt(), defaultValue);
    }

    // The box shown during compaction must go away when the work ends: a box without buttons that
    // refuses to close leaves a window nobody can use.
    void longWorkNoticeShowsProgressAndCloses()
    {
        QWidget window;
        VDRWidgetPrompt prompt;
        prompt.setParentWidget(&window);
        auto visibleBoxes = [] {
            QList<QProgressDialog*> boxes;
            for (QWidget* w : QApplication::topLevelWidgets())
                if (auto* box = qobject_cast<QProgressDialog*>(w); box && box->isVisible())
                    boxes << box;
            return boxes;
        };
        prompt.beginNotice(QStringLiteral("Datenbank bereinigen"),
                           QStringLiteral("Die Datenbank wird jetzt bereinigt."));
        QCOMPARE(visibleBoxes().size(), 1);
        prompt.noticeProgress(40);
        QCOMPARE(visibleBoxes().first()->value(), 40);
        prompt.endNotice();
        QVERIFY(visibleBoxes().isEmpty());
    }
};

QTEST_MAIN(TestSettingsDialogs)
#include "tst_settingsdialogs.moc"
