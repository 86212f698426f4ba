#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "app/VDRMainWindow.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "editing/form/VDREntryWidget.h"
#include "editing/form/VdEvent.h"
#include "editing/form/VdEventsController.h"
#include "editing/reportlist/VDREntryDateWidget.h"
#include "editing/reportlist/VDREntryListWidget.h"
#include "editing/reportlist/VDREntrySelectorWidget.h"

#include <QDockWidget>
#include <QHeaderView>
#include <QLineEdit>
#include <QMenu>
#include <QPushButton>
#include <QRadioButton>
#include <QTableView>
#include <QtTest>

#include <memory>

using namespace VDRTestFixtures;

namespace {
// Stands in for the report form: records the events the list sends.
class EventLog : public QObject
{
public:
    EventLog()
    {
        for (int n : {VdEvent::GotoRow, VdEvent::SaveMetrics, VdEvent::RestoreMetrics})
            VdEventsController::instance()->registerEvent(this, n);
    }
    ~EventLog() override { VdEventsController::instance()->unregisterReceiver(this); }
    QStringList events;

protected:
    void customEvent(QEvent* event) override
    {
        if (auto* e = dynamic_cast<VdEvent*>(event))
            events << QStringLiteral("%1:%2").arg(e->number()).arg(e->arg(0).toInt());
    }
};
} // namespace

// The report list, the calendar and the selection dialog on a diary of four reports:
// 001 (2026-03-02), 002 locked (2026-03-03, author AB), 003 (2026-03-05), 004 (2026-04-20).
class TestVDREntryList : public VDRTestCase
{
    Q_OBJECT

    void initTest() override
    {
        m_doc = std::make_unique<VDRDocument>();
        QVERIFY(m_doc->createDocument(true));
        VDRAllEntryTableModel* model = m_doc->modelEntryAll();
        for (int i = 0; i < 3; ++i)
            QVERIFY(m_doc->appendEntry() == 1 && model->submitAll());
        model->fetch_all();
        const char* dates[] = {"2026-03-02", "2026-03-03", "2026-03-05", "2026-04-20"};
        for (int row = 0; row < 4; ++row)
            QVERIFY(model->setData(row, QStringLiteral("inspection_date"), QString::fromLatin1(dates[row])));
        QVERIFY(model->setData(1, QStringLiteral("user_id"), QStringLiteral("AB")));
        QVERIFY(model->submitAll());
        QVERIFY(m_doc->lockEntry(1, true));
    }

    void cleanupTest() override { m_doc.reset(); }

private slots:
    // A click asks the form to show the row, with the table metrics around it; a row chosen by
    // the form (event 1003) or moved by a removal asks nothing.
    void listNavigates()
    {
        EventLog log;
        VDREntryListWidget list;
        QSignalSpy dates(&list, &VDREntryListWidget::dateSelected);
        list.slotDocumentOpened(m_doc.get());
        list.resize(400, 300);
        list.show();
        QTableView* view = list.findChild<QTableView*>(QStringLiteral("tableViewEntriesAll"));
        QVERIFY(view && QTest::qWaitForWindowExposed(&list));
        QStringList headers;
        for (int c = 0; c < view->model()->columnCount(); ++c)
            if (!view->isColumnHidden(c))
                headers << view->model()->headerData(c, Qt::Horizontal).toString();
        QCOMPARE(headers, QStringList({"Nr.", "Datum", "Autor"}));

        VdEventsController::instance()->send_event(VdEvent::SelectRow, 0);
        QTRY_COMPARE(list.currentRow(), 0);
        QCOMPARE(dates.takeFirst().at(0).toDate(), QDate(2026, 3, 2));
        const int id0 = m_doc->modelEntryAll()->data(0, "id", Qt::EditRole).toInt();
        const int id2 = m_doc->modelEntryAll()->data(2, "id", Qt::EditRole).toInt();
        QTest::mouseClick(
            view->viewport(), Qt::LeftButton, {},
            view->visualRect(view->model()->index(2, m_doc->modelEntryAll()->fieldIndex("number"))).center());
        QTRY_COMPARE(log.events.size(), 3);
        QCOMPARE(log.events, QStringList({QStringLiteral("1007:%1").arg(id0), "1001:2",
                                          QStringLiteral("1008:%1").arg(id2)}));
        QCOMPARE(dates.takeFirst().at(0).toDate(), QDate(2026, 3, 5));
        QTest::keyClick(view, Qt::Key_Down);
        QTRY_COMPARE(log.events.size(), 6);
        QCOMPARE(log.events.at(4), QStringLiteral("1001:3"));

        // The form removes the shown report: the view moves, the list asks nothing.
        log.events.clear();
        QVERIFY(m_doc->removeEntryAll(3));
        VdEventsController::instance()->send_event(VdEvent::SelectRow, 2);
        QTRY_COMPARE(list.currentRow(), 2);
        QCoreApplication::processEvents();
        QCOMPARE(log.events, QStringList());
        QCOMPARE(view->selectionModel()->selectedRows().value(0).row(), 2);
    }

    // Locked reports cannot be renumbered or deleted; commands nobody takes yet are off.
    void contextMenu_data()
    {
        QTest::addColumn<int>("row");
        QTest::addColumn<bool>("deleteSwitch");
        QTest::addColumn<QStringList>("enabled");
        const QStringList all{"actionEntryAllAlterNumber", "actionEntryAllCopy", "actionEntryAllDelete",
                              "actionEntryAllChangeUID"};
        QTest::newRow("draft") << 0 << true << all;
        QTest::newRow("locked") << 1 << true
                                << QStringList({"actionEntryAllCopy", "actionEntryAllChangeUID"});
        QTest::newRow("delete switched off for the shown draft")
            << 0 << false
            << QStringList({"actionEntryAllAlterNumber", "actionEntryAllCopy", "actionEntryAllChangeUID"});
        QTest::newRow("switch speaks only for the shown report") << 2 << false << all;
    }

    void contextMenu()
    {
        QFETCH(int, row);
        QFETCH(bool, deleteSwitch);
        QFETCH(QStringList, enabled);
        VDREntryListWidget list;
        list.slotDocumentOpened(m_doc.get());
        list.selectRow(0);
        list.setDeleteEnabled(deleteSwitch);
        QSignalSpy copy(&list, &VDREntryListWidget::doEntryAllCopy);
        for (auto signal : {&VDREntryListWidget::doEntryAllAlterNumber, &VDREntryListWidget::doEntryAllDelete,
                            &VDREntryListWidget::doEntryAllChangeUID})
            connect(&list, signal, this, [] {});
        std::unique_ptr<QMenu> menu(list.createContextMenu(row, nullptr));
        QStringList names, on;
        for (QAction* a : menu->actions()) {
            names << a->objectName();
            if (a->isEnabled())
                on << a->objectName();
        }
        QCOMPARE(names, QStringList({"actionEntryAllAlterNumber", "actionEntryAllPrint", "actionEntryAllPdf",
                                     "actionEntryAllCopy", "actionEntryAllDelete", "actionEntryAllMail",
                                     "actionEntryAllChangeUID"}));
        QCOMPARE(on, enabled);
        menu->findChild<QAction*>(QStringLiteral("actionEntryAllCopy"))->trigger();
        QCOMPARE(copy.size(), 1);
        QCOMPARE(copy.at(0).at(0).toInt(), row);
    }

    // A date without a report puts the selection back to the shown report's date when that is on
    // the page now shown.
    void calendarClick_data()
    {
        QTest::addColumn<QDate>("shown");
        QTest::addColumn<QDate>("clicked");
        QTest::addColumn<bool>("found");
        QTest::addColumn<QDate>("selected");
        QTest::addColumn<QDate>("remembered");
        const QDate d(2026, 3, 3);
        QTest::newRow("report found")
            << d << QDate(2026, 3, 5) << true << QDate(2026, 3, 5) << QDate(2026, 3, 5);
        QTest::newRow("none, same month") << d << QDate(2026, 3, 9) << false << d << d;
        QTest::newRow("none, other month") << d << QDate(2026, 4, 9) << false << QDate(2026, 4, 9) << d;
        QTest::newRow("none, nothing shown")
            << QDate() << QDate(2026, 3, 9) << false << QDate(2026, 3, 9) << QDate();
    }

    void calendarClick()
    {
        QFETCH(QDate, shown);
        QFETCH(QDate, clicked);
        QFETCH(bool, found);
        QFETCH(QDate, selected);
        QFETCH(QDate, remembered);
        VDREntryDateWidget calendar;
        calendar.showReportDate(shown);
        QList<QDate> asked;
        connect(&calendar, &VDREntryDateWidget::dateSelected, this, [&](const QDate& date, bool& result) {
            asked << date;
            result = found;
        });
        // As a click does: the date is selected (its page shown), then reported.
        calendar.setSelectedDate(clicked);
        emit calendar.clicked(clicked);
        QCOMPARE(asked, QList<QDate>({clicked}));
        QCOMPARE(calendar.selectedDate(), selected);
        QCOMPARE(calendar.rememberedDate(), remembered);
        calendar.setAvailableDates({QDate(2026, 3, 3)});
        QCOMPARE(calendar.dateTextFormat(QDate(2026, 3, 3)).fontWeight(), int(QFont::Bold));
        calendar.setAvailableDates({});
        QCOMPARE(calendar.dateTextFormat().size(), 0);
    }

    // Each mode covers its reports, in row order, and proposes its PDF name.
    void selector_data()
    {
        QTest::addColumn<int>("mode");
        QTest::addColumn<QString>("from");
        QTest::addColumn<QString>("to");
        QTest::addColumn<QList<int>>("rows");
        QTest::addColumn<QString>("pdf");
        QTest::newRow("all") << 1 << ""
                             << "" << QList<int>({0, 1, 2, 3}) << "Bau_ A_B - Berichte 001-004.pdf";
        QTest::newRow("locked") << 2 << ""
                                << "" << QList<int>({1}) << "Bau_ A_B - geschlossene Berichte.pdf";
        QTest::newRow("drafts") << 3 << ""
                                << "" << QList<int>({0, 2, 3}) << "Bau_ A_B - Entwürfe.pdf";
        QTest::newRow("current") << 4 << ""
                                 << "" << QList<int>({2}) << "Bau_ A_B - Bericht 003.pdf";
        QTest::newRow("range") << 5 << "2"
                               << "003" << QList<int>({1, 2}) << "Bau_ A_B - Berichte 002-003.pdf";
        QTest::newRow("range reversed") << 5 << "4"
                                        << "3" << QList<int>({2, 3}) << "Bau_ A_B - Berichte 003-004.pdf";
        QTest::newRow("range empty") << 5 << "7"
                                     << "9" << QList<int>() << "";
    }

    void selector()
    {
        QFETCH(int, mode);
        QFETCH(QString, from);
        QFETCH(QString, to);
        QFETCH(QList<int>, rows);
        QFETCH(QString, pdf);
        QVERIFY(setProjectName(*m_doc, QStringLiteral("Bau/ A|B")));
        QList<int> expected;
        for (int row : rows)
            expected << m_doc->modelEntryAll()->data(row, "id", Qt::EditRole).toInt();
        const QList<int> ids = VDREntrySelectorWidget::entryIds(m_doc.get(), mode, 2, from, to);
        QCOMPARE(ids, expected);
        QCOMPARE(VDREntrySelectorWidget::pdfFileName(m_doc.get(), mode, ids), pdf);

        VDREntrySelectorWidget dialog(mode == 5 ? 1 : mode);
        dialog.setDocument(m_doc.get(), 2);
        QCOMPARE(dialog.getSelectedMode(), mode == 5 ? 1 : mode);
        if (mode == 5) {
            // Typing a number chooses the range.
            auto* edit = dialog.findChild<QLineEdit*>(QStringLiteral("lineEditEntry5From"));
            QCOMPARE(edit->text(), QStringLiteral("00000"));
            edit->selectAll();
            QTest::keyClicks(edit, from + QStringLiteral("x!"));
            QCOMPARE(dialog.getSelectedMode(), 5);
            QCOMPARE(dialog.getSelectionMode5From(), from + "x");
            dialog.setSelectionMode5To(to);
        }
        // Nothing chosen: said, and the dialog stays open.
        if (ids.isEmpty())
            m_prompt.expect(QStringLiteral("Bautagesberichte auswählen"),
                            QStringLiteral("keinen Bautagesbericht"));
        dialog.show();
        dialog.findChild<QPushButton*>(QStringLiteral("pushButtonPdf"))->click();
        QCOMPARE(dialog.isVisible(), ids.isEmpty());
        QCOMPARE(dialog.result(), ids.isEmpty() ? 0 : int(VDREntrySelectorWidget::Pdf));
    }

    // Closing a report dock by its button stores that and says how to get it back.
    void dockCloseHints()
    {
        VDRMainWindow window;
        window.show();
        const struct
        {
            const char* dock;
            QString key;
            QString title;
        } docks[] = {{"dockWidgetEntryList", VDRMainWindow::showEntryListSettingsKey(),
                      "Bautagesberichte wieder einschalten"},
                     {"dockWidgetEntryDate", VDRMainWindow::showEntryDateSettingsKey(),
                      "Bauberichts-Kalender wieder einschalten"}};
        for (const auto& d : docks) {
            auto* dock = window.findChild<QDockWidget*>(QLatin1String(d.dock));
            QVERIFY(dock && dock->isVisible());
            m_prompt.expect(d.title, QStringLiteral("über einen rechten Mausklick"));
            dock->close();
            QCOMPARE(QSettings().value(d.key).toBool(), false);
        }
        window.setShowDockHints(false);
        window.findChild<QDockWidget*>("dockWidgetEntryList")->show();
        window.findChild<QDockWidget*>("dockWidgetEntryList")->close();
    }

    // Leaving a report through the list or the calendar keeps what was typed; a date without a
    // report leaves the form where it was. The context commands act on the row clicked.
    void formFollowsListAndCalendar()
    {
        m_doc.reset();
        QSettings().setValue(VDRMainWindow::showEntryDateSettingsKey(), true);
        QSettings().setValue(VDRMainWindow::showEntryListSettingsKey(), true);
        VDRMainWindow window;
        VDREntryWidget* form = window.entryWidget();
        QVERIFY(form);
        window.show();
        QVERIFY(window.createDocument(true));
        VDRDocument* doc = window.document();
        VDRAllEntryTableModel* model = doc->modelEntryAll();
        for (int i = 0; i < 2; ++i)
            QVERIFY(doc->appendEntry() == 1 && model->submitAll());
        model->fetch_all();
        const QDate dates[] = {QDate(2026, 3, 2), QDate(2026, 3, 3), QDate(2026, 3, 5)};
        for (int row = 0; row < 3; ++row)
            QVERIFY(model->setData(row, QStringLiteral("inspection_date"), dates[row].toString(Qt::ISODate)));
        QVERIFY(model->submitAll());
        form->actionGoto(0, -1);
        VDREntryListWidget* list = window.entryListWidget();
        QTRY_COMPARE(list->currentRow(), 0);
        auto weather = [&](int row) {
            return textsOn(doc->database(), QStringLiteral("SELECT env_weather1 FROM entry WHERE id = %1")
                                                .arg(model->data(row, "id", Qt::EditRole).toInt()));
        };
        auto* field = form->findChild<QLineEdit*>(QStringLiteral("entrydataEnvWeather1"));
        QVERIFY(field);

        QTest::keyClicks(field, QStringLiteral("sonnig"));
        QTableView* view = list->tableView();
        QTest::mouseClick(view->viewport(), Qt::LeftButton, {},
                          view->visualRect(model->index(2, model->fieldIndex("number"))).center());
        QTRY_COMPARE(form->currentRow(), 2);
        QCOMPARE(weather(0), QStringList({"sonnig"}));

        QTRY_VERIFY(window.entryDateWidget());
        VDREntryDateWidget* calendar = window.entryDateWidget();
        QTRY_COMPARE(calendar->selectedDate(), dates[2]);
        QTest::keyClicks(field, QStringLiteral("Regen"));
        const auto click = [calendar](const QDate& date) {
            calendar->setSelectedDate(date);
            emit calendar->clicked(date);
        };
        click(QDate(2026, 3, 9));
        QCOMPARE(form->currentRow(), 2);
        QCOMPARE(calendar->selectedDate(), dates[2]);
        QCOMPARE(field->text(), QStringLiteral("Regen"));
        click(dates[0]);
        QTRY_COMPARE(form->currentRow(), 0);
        QCOMPARE(weather(2), QStringList({"Regen"}));
        QTRY_COMPARE(list->currentRow(), 0);

        // Copy from the list's menu: the copy is shown and selected.
        std::unique_ptr<QMenu> menu(list->createContextMenu(1, nullptr));
        menu->findChild<QAction*>(QStringLiteral("actionEntryAllCopy"))->trigger();
        QTRY_COMPARE(model->rowCount(), 4);
        QTRY_COMPARE(form->currentRow(), 3);
        QTRY_COMPARE(list->currentRow(), 3);
        QCOMPARE(model->data(3, "inspection_date", Qt::EditRole).toString(), dates[1].toString(Qt::ISODate));
        doc->closeDocument();
    }

private:
    std::unique_ptr<VDRDocument> m_doc;
};

QTEST_MAIN(TestVDREntryList)
#include "tst_vdrentrylist.moc"
