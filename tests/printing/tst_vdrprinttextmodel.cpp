#include "VDRTestFixtures.h"
#include "VDRTestPrompt.h"
#include "editing/VDRPrintTextsEditor.h"
#include "printing/CVdTexts.h"
#include "printing/VDRPrintTextModel.h"

#include <QApplication>
#include <QLocale>
#include <QPushButton>
#include <QSettings>
#include <QTemporaryDir>
#include <QtTest>

using namespace VDRTestFixtures;

class TestVDRPrintTextModel : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase()
    {
        QVERIFY(m_dir.isValid());
        isolateSettings(m_dir.filePath(QStringLiteral("settings")));
        QSettings().setValue(QStringLiteral("language"), int(QLocale::German));
    }
    void init()
    {
        m_prompt.reset();
        QSettings().remove(VDRPrintTextModel::settingsGroup());
        CVdTexts::self()->resetModel();
    }
    void cleanup() { VDR_VERIFY_PROMPT(m_prompt); }

    void defaults()
    {
        QCOMPARE(CVdTexts::self()->TextList.size(), 91);
        QCOMPARE(CVdTexts::self()->text(8), QStringLiteral("%1 Personen"));
        QCOMPARE(CVdTexts::self()->text(40), QStringLiteral("Seite ${page.cur}/${page.count}"));
        QVERIFY(CVdTexts::self()->text(38).contains(QStringLiteral("Korvant - Software")));
        QVERIFY(CVdTexts::self()->text(65).endsWith(QLatin1Char('\n')));
        QCOMPARE(CVdTexts::self()->text(90), QStringLiteral("Fototitel: "));
    }

    // Placeholders that differ from the default's are stored only after the user insists.
    void placeholderCheck_data()
    {
        QTest::addColumn<QString>("text");
        QTest::addColumn<int>("answer"); // -1: no question expected; 0 "Text ändern", 1 "Abbrechen"
        QTest::addColumn<bool>("stored");
        QTest::newRow("keeps %1") << "Personen: %1" << -1 << true;
        QTest::newRow("drops %1, user insists") << "Personen" << 0 << true;
        QTest::newRow("drops %1, user cancels") << "Personen" << 1 << false;
        QTest::newRow("adds %2, user cancels") << "%1 Personen, %2" << 1 << false;
    }
    void placeholderCheck()
    {
        QFETCH(QString, text);
        QFETCH(int, answer);
        QFETCH(bool, stored);
        if (answer >= 0)
            m_prompt.expect(QStringLiteral("Fehler in Parametern"), QStringLiteral("Anzahl oder Format"),
                            answer);
        VDRPrintTextModel* model = CVdTexts::self()->model();
        QCOMPARE(model->setData(model->index(8, 0), text), stored);
        QCOMPARE(model->text(8), stored ? text : QStringLiteral("%1 Personen"));
    }

    // Stored per interface language; a stale default is dropped; the editor's reset asks first.
    void storage()
    {
        VDRPrintTextModel* model = CVdTexts::self()->model();
        QVERIFY(model->setData(model->index(6, 0), QStringLiteral("Dabei:")));
        model->writeSettings();
        QSettings settings;
        settings.beginGroup(VDRPrintTextModel::settingsGroup());
        settings.beginWriteArray(QStringLiteral("values"));
        settings.setArrayIndex(91);
        settings.setValue(QStringLiteral("centry"), QStringLiteral("Gibt es nicht mehr:"));
        settings.setValue(QStringLiteral("transEntry"), QStringLiteral("Ersatz"));
        settings.endArray();
        settings.endGroup();

        CVdTexts::self()->resetModel();
        QCOMPARE(CVdTexts::self()->text(6), QStringLiteral("Dabei:"));
        QVERIFY(!CVdTexts::self()->model()->entries().contains(
            qMakePair(QStringLiteral("Gibt es nicht mehr:"), QStringLiteral("Ersatz"))));

        settings.setValue(QStringLiteral("language"), int(QLocale::English));
        CVdTexts::self()->resetModel();
        QCOMPARE(CVdTexts::self()->text(6), QStringLiteral("Anwesende:"));
        settings.setValue(QStringLiteral("language"), int(QLocale::German));
        CVdTexts::self()->resetModel();
        QCOMPARE(CVdTexts::self()->text(6), QStringLiteral("Dabei:"));

        VDRPrintTextsEditor editor(CVdTexts::self()->model(), nullptr);
        auto* reset = editor.findChild<QPushButton*>(QStringLiteral("pbReset"));
        m_prompt.expect(QStringLiteral("Drucktexte ändern"), QStringLiteral("Möchten Sie wirklich"),
                        VDRPrompt::No);
        reset->click();
        QCOMPARE(CVdTexts::self()->text(6), QStringLiteral("Dabei:"));
        m_prompt.expect(QStringLiteral("Drucktexte ändern"), QStringLiteral("Möchten Sie wirklich"),
                        VDRPrompt::Yes);
        reset->click();
        QCOMPARE(CVdTexts::self()->text(6), QStringLiteral("Anwesende:"));
        editor.findChild<QPushButton*>(QStringLiteral("pbOk"))->click();
        CVdTexts::self()->resetModel();
        QCOMPARE(CVdTexts::self()->text(6), QStringLiteral("Anwesende:"));
    }

private:
    QTemporaryDir m_dir;
    VDRTestPrompt m_prompt;
};

QTEST_MAIN(TestVDRPrintTextModel)
#include "tst_vdrprinttextmodel.moc"
