#include "VDRTestCase.h"
#include "app/VDRMainWindow.h"
#include "document/VDRDocument.h"
#include "editing/masterdata/VDRProjectDataWidget.h"
#include "editing/masterdata/VDRProjectLogoWidget.h"
#include "editing/printdialogs/VDROutputSelectDialog.h"

#include <QAction>
#include <QApplication>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QTabWidget>
#include <QTimer>
#include <QtTest>

#include <memory>

// The main window's master-data actions open the dialog on their tab and show its result.
class TestProjectDataActions : public VDRTestCase
{
    Q_OBJECT

private slots:
    void actionsOpenTheirTab_data()
    {
        QTest::addColumn<QString>("action");
        QTest::addColumn<int>("tab");
        QTest::addColumn<QString>("button");
        QTest::newRow("Projektdaten, OK") << "actionSettingsProjectData" << 0 << "pbOk";
        QTest::newRow("Projektdaten, Abbrechen") << "actionSettingsProjectData" << 0 << "pbCancel";
        QTest::newRow("Firmenliste") << "actionSettingsCompanyList" << 1 << "pbOk";
        QTest::newRow("Firmendaten Ausgabeformat") << "actionFormatCompany" << 2 << "pbOk";
    }

    void actionsOpenTheirTab()
    {
        QFETCH(QString, action);
        QFETCH(int, tab);
        QFETCH(QString, button);
        VDRMainWindow window;
        window.show();
        QAction* trigger = window.ui().action(action);
        QVERIFY(trigger);
        QVERIFY(!trigger->toolTip().contains("noch nicht verfügbar"));
        QVERIFY(window.createDocument(true));
        QVERIFY(trigger->isEnabled());

        int shownTab = -1;
        bool printShown = true;
        QTimer::singleShot(0, this, [&] {
            auto* dialog = qobject_cast<VDRProjectDataWidget*>(QApplication::activeModalWidget());
            if (!dialog)
                return;
            shownTab = dialog->findChild<QTabWidget*>("tabWidget")->currentIndex();
            printShown = dialog->findChild<QPushButton*>("pbPrint")->isVisible();
            dialog->findChild<QLineEdit*>("lineEditProjectname")->setText("Brücke Nord");
            dialog->findChild<QPushButton*>(button)->click();
        });
        trigger->trigger();
        QCOMPARE(shownTab, tab);
        QCOMPARE(printShown, tab != 0); // the company tabs print the company list
        const bool ok = button == QLatin1String("pbOk");
        QCOMPARE(window.document()->projectName(), QString(ok ? "Brücke Nord" : "Neues Varduna"));
        bool shown = false;
        for (QLabel* label : window.findChildren<QLabel*>())
            shown |= label->text().contains("Brücke Nord");
        QCOMPARE(shown, ok);
        window.document()->closeDocument();
        window.updateGui();
        QVERIFY(!trigger->isEnabled());
    }

    void logoActionOpensLogoDialog()
    {
        VDRMainWindow window;
        window.show();
        QAction* trigger = window.ui().action("actionSettingsProjectLogo");
        QVERIFY(!trigger->isEnabled());
        QVERIFY(window.createDocument(true));
        QVERIFY(trigger->isEnabled());
        QString title;
        QTimer::singleShot(0, this, [&] {
            if (auto* dialog = qobject_cast<VDRProjectLogoWidget*>(QApplication::activeModalWidget())) {
                title = dialog->windowTitle();
                dialog->findChild<QPushButton*>("pbCancel")->click();
            }
        });
        trigger->trigger();
        QCOMPARE(title, QString("Projektlogo"));
        window.document()->closeDocument();
    }

    // "Drucken" on the company tab asks for printer or PDF and writes the company list.
    void printButtonPrintsCompanyList()
    {
        VDRMainWindow window;
        window.show();
        QVERIFY(window.createDocument(true));
        const QString pdf = m_dir.filePath(QStringLiteral("Liste.pdf"));
        m_prompt.expectFileName(pdf);
        bool chosen = false;
        QTimer::singleShot(0, this, [&] {
            auto* dialog = qobject_cast<VDRProjectDataWidget*>(QApplication::activeModalWidget());
            if (!dialog)
                return;
            QTimer::singleShot(0, this, [&, dialog] {
                auto* select = qobject_cast<VDROutputSelectDialog*>(QApplication::activeModalWidget());
                if (select) {
                    chosen = true;
                    select->findChild<QPushButton*>(QStringLiteral("pbPdf"))->click();
                }
                QTimer::singleShot(0, dialog, [dialog] {
                    dialog->findChild<QPushButton*>(QStringLiteral("pbCancel"))->click();
                });
            });
            dialog->findChild<QPushButton*>(QStringLiteral("pbPrint"))->click();
        });
        window.ui().action(QStringLiteral("actionSettingsCompanyList"))->trigger();
        QVERIFY(chosen);
        QVERIFY(QFileInfo(pdf).size() > 0);
        window.document()->closeDocument();
    }
};

QTEST_MAIN(TestProjectDataActions)
#include "tst_projectdataactions.moc"
