#include "VDRTestCase.h"
#include "editing/printdialogs/CVdPrintPreview.h"
#include "editing/printdialogs/CVdPrintoutSettings.h"
#include "editing/printdialogs/VDRPrintTextsEditor.h"
#include "printing/CVdConfig.h"
#include "printing/CVdTexts.h"
#include "printing/VDRPrintTextModel.h"

#include <QApplication>
#include <QLabel>
#include <QLocale>
#include <QPushButton>
#include <QSettings>
#include <QSpinBox>
#include <QtTest>

class TestPrintDialogs : public VDRTestCase
{
    Q_OBJECT

    void initRun() override { QSettings().setValue(QStringLiteral("language"), int(QLocale::German)); }
    void initTest() override
    {
        QSettings().remove(VDRPrintTextModel::settingsGroup());
        CVdTexts::self()->resetModel();
    }

private slots:
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

    // Margins keep to their ranges, and OK makes them the printouts' margins from now on.
    void margins()
    {
        CVdPrintoutSettings dialog;
        const struct
        {
            const char* name;
            int max;
            int value;
        } boxes[] = {{"sbLeft", 70, 20}, {"sbRight", 70, 21}, {"sbTop", 99, 22}, {"sbBottom", 99, 23}};
        for (const auto& b : boxes) {
            auto* box = dialog.findChild<QSpinBox*>(QLatin1String(b.name));
            QVERIFY(box);
            QCOMPARE(box->minimum(), 0);
            QCOMPARE(box->maximum(), b.max);
            QCOMPARE(box->suffix(), QStringLiteral(" mm"));
            box->setValue(b.value);
        }
        dialog.findChild<QPushButton*>(QStringLiteral("pbOk"))->click();
        CVdConfig::self()->reload();
        QCOMPARE(CVdConfig::self()->leftMargin, 20);
        QCOMPARE(CVdConfig::self()->bottomMargin, 23);
        CVdPrintoutSettings again;
        again.findChild<QPushButton*>(QStringLiteral("pbDefaults"))->click();
        QCOMPARE(again.findChild<QSpinBox*>(QStringLiteral("sbTop"))->value(), 10);
        again.findChild<QPushButton*>(QStringLiteral("pbOk"))->click();
        QCOMPARE(CVdConfig::self()->leftMargin, 15);
    }

    // One page: labelled 1 of 1, and the page buttons stay there; the page images go with the dialog.
    void preview()
    {
        const QString file = m_dir.filePath(QStringLiteral("picture_0001.jpeg"));
        QImage page(100, 140, QImage::Format_RGB32);
        page.fill(Qt::white);
        QVERIFY(page.save(file, "JPEG"));
        {
            CVdPrintPreview preview(nullptr, {file});
            preview.show();
            auto* label = preview.findChild<QLabel*>(QStringLiteral("labelPage"));
            QCOMPARE(label->text(), QStringLiteral("Seite 1/1"));
            preview.next();
            preview.previous();
            QCOMPARE(preview.currentPage(), 0);
            QCOMPARE(label->text(), QStringLiteral("Seite 1/1"));
        }
        QVERIFY(!QFile::exists(file));
    }
};

QTEST_MAIN(TestPrintDialogs)
#include "tst_printdialogs.moc"
