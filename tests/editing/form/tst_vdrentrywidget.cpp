#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "app/VDRMainWindow.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "editing/completion/VDRCompleterLineEdit.h"
#include "editing/completion/VDRCompleterTextEdit.h"
#include "editing/form/VDREntryWidget.h"
#include "editing/form/VDRRichTextEdit.h"
#include "editing/form/VDRRichTextEditDialog.h"
#include "editing/form/VdEvent.h"
#include "editing/form/VdEventsController.h"
#include "editing/reportlist/QSpinBoxLetter.h"
#include "editing/tables/VDRTableView.h"

#include <QAction>
#include <QApplication>
#include <QClipboard>
#include <QDialog>
#include <QDockWidget>
#include <QHeaderView>
#include <QInputDialog>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QSettings>
#include <QSignalSpy>
#include <QSpinBox>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTabWidget>
#include <QTimer>
#include <QToolButton>
#include <QtTest>

#include <functional>
#include <memory>

using namespace VDRTestFixtures;

// Drives the report form inside the real main window, headless.
class TestVDREntryWidget : public VDRTestCase
{
    Q_OBJECT

    void initRun() override
    {
        // A screenshot shows the window as a German user sees it: the calendar and the clock take
        // their names from the locale the window is built with.
        if (!qgetenv("VARDUNA_SCREENSHOT").isEmpty())
            QLocale::setDefault(QLocale(QLocale::German, QLocale::Germany));
    }

    void initTest() override
    {
        VDRDocument::setGlobalModified(false);
        QSettings().remove(QStringLiteral("entry/UID"));
        m_window = std::make_unique<VDRMainWindow>();
        m_window->show();
        m_form = m_window->entryWidget();
    }

    void cleanupTest() override
    {
        if (m_window && m_window->document()->isStateValid())
            m_window->document()->closeDocument();
        m_window.reset();
    }

private slots:
    void newDiaryShowsFirstReport()
    {
        QVERIFY(m_window->createDocument(true));
        QCOMPARE(m_form->currentRow(), 0);
        const QString expected =
            QStringLiteral("<b>Projekt: Neues Varduna, Baubericht 001 (Entwurf) vom %1</b>")
                .arg(QLocale().toString(QDate::currentDate(), QLocale::ShortFormat));
        QCOMPARE(m_form->headLine(), expected);
        QStringList titles;
        for (int i = 0; i < m_form->tabWidget()->count(); ++i)
            titles << m_form->tabWidget()->tabText(i);
        QCOMPARE(titles, QStringList({"Bautenstand", "Anwesende", "Störungen", "Bauablauf", "Vermerke",
                                      "Baustoffe", "Pläne und Dokumente", "Geräte und Maschinen"}));
        QCOMPARE(m_form->views().size(), 14);
        // Functions not available yet are there, disabled, and say why.
        for (const char* name :
             {"pushButtonPhotos1", "pushButtonSketch2", "pbAudio", "pbPrintDfcyList", "pbSynch"}) {
            auto* b = m_form->findChild<QPushButton*>(QLatin1String(name));
            QVERIFY2(b && !b->isEnabled() && b->toolTip().contains(QStringLiteral("noch nicht verfügbar")),
                     name);
        }
        QVERIFY(m_window->ui().action(QStringLiteral("actionEntryNew"))->isEnabled());
        // Deficiencies read description, room, room book number, company, date, images.
        VDRTableView* dfcy = m_form->view(QStringLiteral("entrydataDfcy"));
        QStringList order;
        for (int visual = 0; visual < dfcy->horizontalHeader()->count(); ++visual) {
            const int column = dfcy->horizontalHeader()->logicalIndex(visual);
            if (!dfcy->isColumnHidden(column))
                order << dfcy->vdrModel()->record().fieldName(column);
        }
        QCOMPARE(order, QStringList({"description", "roomname", "roombook_number", "company_id", "date",
                                     "image_cnt"}));
    }

    // Every way of leaving a report with typed, unsaved text keeps that text.
    void leavingKeepsTypedText_data()
    {
        QTest::addColumn<QString>("route");
        QTest::addColumn<bool>("inFile"); // else in the working copy
        for (const char* route : {"save button", "next", "key", "list", "calendar"})
            QTest::newRow(route) << route << false;
        QTest::newRow("end of session") << "session" << false;
        for (const char* route : {"ctrl+s", "close", "quit"})
            QTest::newRow(route) << route << true;
    }

    void leavingKeepsTypedText()
    {
        QFETCH(QString, route);
        QFETCH(bool, inFile);
        const QString path = openDiaryWithReports(2);
        auto* weather = m_form->findChild<VDRCompleterLineEdit*>(QStringLiteral("entrydataEnvWeather1"));
        auto* progress = m_form->findChild<VDRRichTextEdit*>(QStringLiteral("entrydataProgress"));
        weather->setFocus();
        QTest::keyClicks(weather, QStringLiteral("heiter"));
        progress->textEdit()->setFocus();
        QTest::keyClicks(progress->textEdit(), QStringLiteral("Decke betoniert"));
        const QString workingCopy = m_window->document()->getFilepathWorkingCopy();

        if (route == QLatin1String("save button"))
            QTest::mouseClick(m_form->findChild<QPushButton*>(QStringLiteral("pushButtonSave")),
                              Qt::LeftButton);
        else if (route == QLatin1String("next"))
            m_window->ui().action(QStringLiteral("actionEntryGotoNext"))->trigger();
        else if (route == QLatin1String("key"))
            QTest::keyClick(progress->textEdit(), Qt::Key_PageDown, Qt::ControlModifier);
        else if (route == QLatin1String("list"))
            VdEventsController::instance()->send_event(VdEvent::GotoRow, 1);
        else if (route == QLatin1String("calendar")) {
            m_form->actionAskForSubmit();
            QVERIFY(m_form->actionGotoDate(QDate(2026, 3, 3)));
        } else if (route == QLatin1String("session"))
            m_window->endSession();
        else if (route == QLatin1String("ctrl+s"))
            m_window->ui().action(QStringLiteral("actionFileSave"))->trigger();
        else {
            m_prompt.expect(QStringLiteral("Dokument geändert"), QString(), VDRPrompt::Save);
            if (route == QLatin1String("close"))
                QVERIFY(m_window->closeDocument(true));
            else
                QVERIFY(m_window->close());
        }
        if (route != QLatin1String("save button") && route != QLatin1String("session") && !inFile)
            QTRY_COMPARE(m_form->currentRow(), 1);
        const QString file = inFile ? path : workingCopy;
        if (!inFile && m_window->document()->isStateValid()) {
            QSqlQuery q(m_window->document()->database());
            QVERIFY(q.exec(QStringLiteral("SELECT env_weather1, progress FROM entry ORDER BY id LIMIT 1")) &&
                    q.next());
            QCOMPARE(q.value(0).toString(), QStringLiteral("heiter"));
            QVERIFY(q.value(1).toString().contains(QStringLiteral("Decke betoniert")));
        } else {
            const QList<QVariantList> rows = queryRows(
                file, QStringLiteral("SELECT env_weather1, progress FROM entry ORDER BY id LIMIT 1"));
            QCOMPARE(rows.value(0).value(0).toString(), QStringLiteral("heiter"));
            QVERIFY(rows.value(0).value(1).toString().contains(QStringLiteral("Decke betoniert")));
        }
    }

    void navigationAndReportOperations()
    {
        openDiaryWithReports(3);
        m_window->ui().action(QStringLiteral("actionEntryGotoLast"))->trigger();
        QCOMPARE(m_form->currentRow(), 2);
        QVERIFY(!m_form->is_not_last());
        m_window->ui().action(QStringLiteral("actionEntryGotoPrevious"))->trigger();
        QCOMPARE(m_form->currentRow(), 1);
        m_window->ui().action(QStringLiteral("actionEntryGotoFirst"))->trigger();
        m_window->ui().action(QStringLiteral("actionEntryGotoPrevious"))->trigger();
        QCOMPARE(m_form->currentRow(), 0);
        m_window->ui().action(QStringLiteral("actionEntryNew"))->trigger();
        QCOMPARE(numberShown(), QStringLiteral("004"));
        m_window->ui().action(QStringLiteral("actionEntryCopy"))->trigger();
        QCOMPARE(numberShown(), QStringLiteral("005"));

        // Insert through the dialog: "007" with index 1 is "007a".
        answerDialog([](QDialog* d) {
            d->findChild<QSpinBox*>(QStringLiteral("spinBoxNumber"))->setValue(7);
            d->findChild<QSpinBoxLetter*>(QStringLiteral("spinBoxLetter"))->setValue(1);
            d->accept();
        });
        m_window->ui().action(QStringLiteral("actionEntryInsert"))->trigger();
        QCOMPARE(numberShown(), QStringLiteral("007a"));
        const int count = rowCount();
        // A number in use is refused before anything is created.
        m_prompt.expect(QStringLiteral("Fehler"), QStringLiteral("Die Nummer 002 ist bereits vergeben!"));
        QVERIFY(!m_form->insertWithNumber(QStringLiteral("002"), 0));
        QCOMPARE(rowCount(), count);
        // One of the predecessor file: after confirmation.
        QSqlQuery q(m_window->document()->database());
        QVERIFY(q.exec(
            QStringLiteral("INSERT INTO external_entry_number (number, filepath) VALUES ('9', 'alt.vd2')")));
        m_window->document()->modelExternalEntryNumber()->select();
        m_prompt.expect(QStringLiteral("Warnung"), QStringLiteral("Vorgänger-Datei alt.vd2"), VDRPrompt::No);
        QVERIFY(!m_form->insertWithNumber(QStringLiteral("009"), 0));
        m_prompt.expect(QStringLiteral("Warnung"), QStringLiteral("Vorgänger-Datei alt.vd2"), VDRPrompt::Yes);
        QVERIFY(m_form->insertWithNumber(QStringLiteral("009"), 0));
        QCOMPARE(numberShown(), QStringLiteral("009"));
        QCOMPARE(rowCount(), count + 1);

        answerDialog([](QDialog* d) {
            d->findChild<QSpinBox*>(QStringLiteral("spinBoxNumber"))->setValue(12);
            d->findChild<QSpinBoxLetter*>(QStringLiteral("spinBoxLetter"))->setValue(2);
            d->accept();
        });
        m_window->ui().action(QStringLiteral("actionEntryAlterNumber"))->trigger();
        QCOMPARE(numberShown(), QStringLiteral("012b"));

        // Deleting the last row shows the new last row; deleting the only one shows none.
        m_form->actionToLast();
        const int last = m_form->currentRow();
        m_prompt.expect(QStringLiteral("Bericht löschen"), QStringLiteral("wirklich löschen"),
                        VDRPrompt::Yes);
        m_window->ui().action(QStringLiteral("actionEntryDelete"))->trigger();
        QCOMPARE(m_form->currentRow(), last - 1);
        while (rowCount() > 1) {
            m_prompt.expect(QStringLiteral("Bericht löschen"), QString(), VDRPrompt::Yes);
            m_form->actionDelete();
        }
        m_prompt.expect(QStringLiteral("Bericht löschen"), QString(), VDRPrompt::Yes);
        m_form->actionDelete();
        QCOMPARE(m_form->currentRow(), -1);
        QCOMPARE(m_form->headLine(), QStringLiteral("<b>Kein Bericht ausgewählt.</b>"));
        m_form->actionToNext();
        m_form->actionDelete();
        QCOMPARE(m_form->currentRow(), -1);
    }

    void lockedReportRefusesChanges_data()
    {
        QTest::addColumn<int>("audioStatus"); // -1: no dictation
        QTest::addColumn<QString>("sentence");
        QTest::newRow("none") << -1 << QString();
        QTest::newRow("pending") << 1 << "ein anhängiges Diktat";
        QTest::newRow("completed") << 2 << "ein erledigtes Diktat";
        QTest::newRow("other") << 0 << "ein Diktat.";
    }

    void lockedReportRefusesChanges()
    {
        QFETCH(int, audioStatus);
        QFETCH(QString, sentence);
        openDiaryWithReports(1);
        VDRDocument* doc = m_window->document();
        if (audioStatus >= 0) {
            QSqlQuery q(doc->database());
            QVERIFY(q.exec(QStringLiteral("INSERT INTO audio (id, recording, recording_date, recording_time, "
                                          "recording_status) VALUES (5, x'00', '2026-03-02', '10:00', %1)")
                               .arg(audioStatus)));
            QVERIFY(doc->modelEntryAll()->setData(0, QStringLiteral("progress_audio_id"), 5));
            QVERIFY(doc->modelEntryAll()->submitAll());
        }
        m_prompt.expect(QStringLiteral("Bericht abschließen"),
                        sentence.isEmpty() ? QStringLiteral("vornehmen. Fortsetzen?") : sentence,
                        VDRPrompt::Yes);
        QTest::mouseClick(m_form->findChild<QPushButton*>(QStringLiteral("pushButtonFinish")),
                          Qt::LeftButton);
        QCOMPARE(numberShown(), QStringLiteral("001"));
        QVERIFY(!m_form->headLine().contains(QStringLiteral("Entwurf")));
        if (audioStatus >= 0)
            QCOMPARE(queryCount(QStringLiteral("SELECT count(*) FROM audio")), 0);

        m_prompt.expect(QStringLiteral("Bericht löschen"),
                        QStringLiteral("abgeschlossenen Bericht nicht löschen"));
        m_form->actionDelete();
        m_form->actionAlterNumber(); // nothing, no dialog
        m_prompt.expect(QStringLiteral("Autor ändern"), QStringLiteral("da der Bericht abgeschlossen ist"));
        m_form->actionEntryChangeUID();
        QCOMPARE(rowCount(), 1);
        for (VDRTableView* v : m_form->views()) {
            QCOMPARE(v->editTriggers(), QAbstractItemView::NoEditTriggers);
            QCOMPARE(v->selectionMode(), QAbstractItemView::NoSelection);
        }
        QVERIFY(m_form->findChild<VDRRichTextEdit*>(QStringLiteral("entrydataProgress"))
                    ->textEdit()
                    ->isReadOnly());
        QVERIFY(!m_form->findChild<QLineEdit*>(QStringLiteral("entrydataEnvWeather1"))->isEnabled());
    }

    void authorCodes_data()
    {
        QTest::addColumn<QString>("typed");
        QTest::addColumn<QString>("stored");
        QTest::newRow("two letters") << "AB"
                                     << "AB";
        QTest::newRow("cut at two") << "x9z"
                                    << "x9";
        QTest::newRow("no punctuation") << "a-"
                                        << "a";
    }

    void authorCodes()
    {
        QFETCH(QString, typed);
        QFETCH(QString, stored);
        openDiaryWithReports(1);
        QString label;
        answerDialog([&](QDialog* d) {
            label = static_cast<QInputDialog*>(d)->labelText();
            auto* edit = d->findChild<QLineEdit*>();
            edit->clear();
            QTest::keyClicks(edit, typed);
            d->accept();
        });
        m_window->ui().action(QStringLiteral("actionSettingsChangeUID"))->trigger();
        QVERIFY(label.startsWith(QStringLiteral("Geben Sie hier die Benutzer-ID")));
        QCOMPARE(QSettings().value(QStringLiteral("entry/UID")).toString(), stored);
        answerDialog([&](QDialog* d) {
            label = static_cast<QInputDialog*>(d)->labelText();
            QCOMPARE(static_cast<QInputDialog*>(d)->textValue(), stored);
            d->accept();
        });
        m_window->ui().action(QStringLiteral("actionEntryChangeUID"))->trigger();
        QVERIFY(label.startsWith(QStringLiteral("Ändern Sie hier den Autor des Berichts 001.")));
        QVERIFY(m_form->headLine().contains(QStringLiteral("Bericht erstellt von: ") + stored));
        QVERIFY(m_form->headLine().contains(QStringLiteral("001-") + stored + QStringLiteral(" (Entwurf)")));
    }

    void badStoredValuesAndHugePaste_data()
    {
        QTest::addColumn<QVariant>("date");
        QTest::newRow("empty") << QVariant(QStringLiteral(""));
        QTest::newRow("30 February") << QVariant(QStringLiteral("2026-02-30"));
    }

    void badStoredValuesAndHugePaste()
    {
        QFETCH(QVariant, date);
        openDiaryWithReports(2);
        QSqlQuery q(m_window->document()->database());
        q.prepare(
            QStringLiteral("UPDATE entry SET inspection_date = :d WHERE id = (SELECT min(id) FROM entry)"));
        q.bindValue(QStringLiteral(":d"), date);
        QVERIFY(q.exec());
        m_window->document()->modelEntryAll()->select();
        m_form->actionGoto(0);
        QCOMPARE(m_form->findChild<QLineEdit*>(QStringLiteral("entrydataInspectionDate"))->text(), QString());
        auto* notice = m_form->findChild<VDRRichTextEdit*>(QStringLiteral("entrydataNotice"));
        QApplication::clipboard()->setText(QString(100000, QLatin1Char('x')));
        notice->textEdit()->setFocus();
        notice->textEdit()->paste();
        m_form->actionToNext();
        QCOMPARE(m_form->currentRow(), 1);
        // The unreadable date stays as stored; the paste arrived whole.
        const QString sql =
            QStringLiteral("SELECT inspection_date, length(notice) FROM entry ORDER BY id LIMIT 1");
        QVERIFY(q.exec(sql) && q.next());
        QCOMPARE(q.value(0).toString(), date.toString());
        QVERIFY(q.value(1).toInt() >= 100000);
    }

    void richTextToolbar_data()
    {
        QTest::addColumn<QString>("button");
        QTest::addColumn<QString>("markup");
        QTest::newRow("bold") << "btnBold"
                              << "font-weight:600";
        QTest::newRow("italic") << "btnItalic"
                                << "font-style:italic";
        QTest::newRow("underline") << "btnUnderline"
                                   << "text-decoration: underline";
        QTest::newRow("strike-out") << "btnStrikeOut"
                                    << "text-decoration: line-through";
        QTest::newRow("marker") << "btnMarker"
                                << "background-color:#ffff00";
        QTest::newRow("numbered list") << "btnListNum"
                                       << "<ol";
        QTest::newRow("indent") << "btnIncreaseIndent"
                                << "-qt-block-indent:1";
    }

    // A formatting button applies to the selection, and the text keeps it through saving.
    void richTextToolbar()
    {
        QFETCH(QString, button);
        QFETCH(QString, markup);
        openDiaryWithReports(1);
        auto* tests = m_form->findChild<VDRRichTextEdit*>(QStringLiteral("entrydataTests"));
        QCOMPARE(tests->fieldNumber(), 3);
        tests->textEdit()->setFocus();
        QTest::keyClicks(tests->textEdit(), QStringLiteral("Druckprobe"));
        tests->textEdit()->selectAll();
        tests->button(button)->click();
        m_form->actionSubmit();
        QSqlQuery q(m_window->document()->database());
        QVERIFY(q.exec(QStringLiteral("SELECT tests FROM entry")) && q.next());
        QVERIFY2(q.value(0).toString().contains(markup), qPrintable(q.value(0).toString()));
        // The enlarged editor shows 13pt as 16pt and gives back 13pt.
        const QString html = QStringLiteral("<span style=\" font-size:13pt;\">x</span>");
        QVERIFY(VDRRichTextEditDialog::enlarged(html).contains(QStringLiteral("font-size:16pt;")));
        QCOMPARE(VDRRichTextEditDialog::normal(VDRRichTextEditDialog::enlarged(html)), html);
        QCOMPARE(VDRRichTextEditDialog::titleFor(3), QStringLiteral("Prüfungen / Messungen"));
    }

    void demoDiaryShowsItsReports()
    {
        QCOMPARE(m_window->openDocument(VDRMainWindow::demoProjectPath(), true, true), 0);
        QVERIFY(m_form->currentRow() >= 0);
        bool weather = false, people = false, progress = false, deficiencies = false;
        for (int row = 0; row < rowCount(); ++row) {
            m_form->actionGoto(row);
            weather |= !m_form->findChild<QLineEdit*>(QStringLiteral("entrydataEnvWeather1"))
                            ->text()
                            .trimmed()
                            .isEmpty();
            people |= m_form->view(QStringLiteral("entrydataWorkforce"))->model()->rowCount() > 0;
            progress |= !m_form->findChild<VDRRichTextEdit*>(QStringLiteral("entrydataProgress"))
                             ->textEdit()
                             ->toPlainText()
                             .trimmed()
                             .isEmpty();
            deficiencies |= m_form->view(QStringLiteral("entrydataDfcy"))->model()->rowCount() > 0;
        }
        QVERIFY(weather && people && progress && deficiencies);
        m_form->actionGoto(0);
        QVERIFY(m_form->headLine().contains(m_window->document()->projectName().toHtmlEscaped()));
        const QByteArray screenshot = qgetenv("VARDUNA_SCREENSHOT");
        if (!screenshot.isEmpty()) {
            // A draft, with the list and calendar beside it and nothing else.
            m_form->actionToLast();
            for (QDockWidget* dock : m_window->findChildren<QDockWidget*>())
                dock->setVisible(dock->objectName().startsWith(QLatin1String("dockWidgetEntry")));
            m_window->resize(1280, 860);
            QTest::qWait(100);
            QVERIFY(m_window->grab().save(QString::fromLocal8Bit(screenshot)));
        }
    }

private:
    // A saved diary with 'reports' reports dated from 2 March 2026 on, open in the window.
    QString openDiaryWithReports(int reports)
    {
        const QString path = m_dir.filePath(QStringLiteral("form%1.vd2").arg(++m_files));
        if (!createDiary(path))
            return QString();
        QStringList sql;
        for (int i = 1; i < reports; ++i)
            sql << QStringLiteral(
                       "CREATE TEMP TABLE copy AS SELECT * FROM entry WHERE id = (SELECT min(id) FROM entry)")
                << QStringLiteral("UPDATE copy SET id = (SELECT max(id) + 1 FROM entry), number = "
                                  "printf('%03d (Entwurf)', %1)")
                       .arg(i + 1)
                << QStringLiteral("INSERT INTO entry SELECT * FROM copy")
                << QStringLiteral("DROP TABLE copy");
        sql << QStringLiteral(
            "UPDATE id_generator SET id_counter = (SELECT max(id) FROM entry) WHERE id_table = 'entry'");
        sql << QStringLiteral("UPDATE entry SET inspection_date = date('2026-03-01', '+' || id || ' days')");
        if (!execSql(path, sql))
            return QString();
        if (m_window->openDocument(path, true, true) != 0)
            return QString();
        return path;
    }

    QString numberShown() const { return m_window->document()->entryNumberString(m_form->currentRow()); }
    int rowCount() const
    {
        m_window->document()->modelEntryAll()->fetch_all();
        return m_window->document()->modelEntryAll()->rowCount();
    }
    int queryCount(const QString& sql) const
    {
        QSqlQuery q(m_window->document()->database());
        return q.exec(sql) && q.next() ? q.value(0).toInt() : -1;
    }
    // Answers the next modal dialog once it is shown.
    void answerDialog(std::function<void(QDialog*)> answer)
    {
        auto* timer = new QTimer(this);
        timer->setInterval(20);
        connect(timer, &QTimer::timeout, this, [timer, answer] {
            if (auto* d = qobject_cast<QDialog*>(QApplication::activeModalWidget())) {
                timer->stop();
                timer->deleteLater();
                answer(d);
            }
        });
        timer->start();
    }

    std::unique_ptr<VDRMainWindow> m_window;
    VDREntryWidget* m_form = nullptr;
    int m_files = 0;
};

QTEST_MAIN(TestVDREntryWidget)
#include "tst_vdrentrywidget.moc"
