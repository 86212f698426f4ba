#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/form/VdEvent.h"
#include "editing/form/VdEventsController.h"
#include "editing/masterdata/VDRCompanyDialog.h"
#include "editing/tables/VDRIntModel.h"
#include "editing/tables/VDRItemDelegate.h"
#include "editing/tables/VDRTableView.h"
#include "editing/tables/VDRTableViewDialog.h"
#include "editing/tables/VDRTextEditComboBox.h"
#include "editing/tables/VDRTextEditComboBoxListView.h"
#include "editing/time/VDRTimePickerWidget.h"
#include "editing/time/VDRTimeRecordingWidget.h"

#include <QAbstractButton>
#include <QApplication>
#include <QClipboard>
#include <QComboBox>
#include <QLineEdit>
#include <QMimeData>
#include <QSettings>
#include <QSpinBox>
#include <QSqlError>
#include <QSqlQuery>
#include <QTextEdit>
#include <QToolButton>
#include <QtTest>

#include <memory>

using namespace VDRTestFixtures;
using M = VDRSqlTableModel;

namespace {
const int kEntry = 1;

QString valueText(const QVariant& v)
{
    if (v.isNull())
        return QStringLiteral("NULL");
    if (v.type() == QVariant::Time)
        return v.toTime().toString(QStringLiteral("hh:mm"));
    if (v.type() == QVariant::Date)
        return v.toDate().toString(Qt::ISODate);
    return v.toString();
}

// Opens a cell's editor with the edit key, replaces its text by typing (or pasting), and commits with
// Return. An editor that refuses the text stays open; Escape closes it then.
void typeIntoCell(VDRTableView* view, int row, const QString& field, const QString& typed, bool paste = false)
{
    const QModelIndex index = view->vdrModel()->index(row, field);
    view->setCurrentIndex(index);
    view->setFocus();
    QTest::keyClick(view, Qt::Key_F2);
    QWidget* editor = view->indexWidget(index);
    QVERIFY2(editor, qPrintable(QStringLiteral("no editor for ") + field));
    QWidget* target = editor;
    if (auto* combo = qobject_cast<QComboBox*>(editor)) {
        target = combo->lineEdit();
        combo->lineEdit()->selectAll();
    } else if (auto* spin = qobject_cast<QSpinBox*>(editor)) {
        spin->selectAll();
    } else if (auto* line = qobject_cast<QLineEdit*>(editor)) {
        line->selectAll();
    } else if (auto* text = qobject_cast<QTextEdit*>(editor)) {
        text->selectAll();
    }
    if (paste) {
        QApplication::clipboard()->setText(typed);
        if (auto* text = qobject_cast<QTextEdit*>(target))
            text->paste();
        else if (auto* line = qobject_cast<QLineEdit*>(target))
            line->paste();
    } else if (typed.isEmpty()) {
        QTest::keyClick(target, Qt::Key_Delete);
    } else {
        QTest::keyClicks(target, typed);
    }
    QTest::keyClick(target, Qt::Key_Return);
    QTest::qWait(0);
    QCoreApplication::processEvents();
    if (view->indexWidget(index))
        QTest::keyClick(view->indexWidget(index), Qt::Key_Escape);
    QTRY_VERIFY(!view->indexWidget(index));
}
} // namespace

// Takes drops without a running drag.
class DropView : public VDRTableView
{
public:
    using VDRTableView::dropEvent;
};

class TestVDRTableView : public VDRTestCase
{
    Q_OBJECT

    void initTest() override
    {
        m_doc = std::make_unique<VDRDocument>();
        QVERIFY(m_doc->createDocument(true));
        QVERIFY(m_doc->appendCompany2());
        M* companies = m_doc->modelCompany2();
        const int row = companies->rowCount() - 1;
        companies->setData(row, QStringLiteral("company"), QStringLiteral("Bau GmbH"));
        companies->setData(row, QStringLiteral("type"), QStringLiteral("Rohbau"));
        m_companyId = companies->data(row, QStringLiteral("id"), Qt::EditRole).toInt();
        QVERIFY(companies->submitAll());
    }

    void cleanupTest() override
    {
        m_view.reset();
        m_doc.reset();
    }

private slots:
    // Each editor kind writes what the user typed, in the form the column keeps.
    void editCells_data()
    {
        QTest::addColumn<int>("table");
        QTest::addColumn<QStringList>("edits");
        QTest::addColumn<QString>("field");
        QTest::addColumn<QString>("expected");
        QTest::addColumn<QString>("message");

        const QString today = QDate::currentDate().toString(Qt::ISODate);
        const auto row = [](const char* tag, M::TABLE_NAMES table, const QStringList& edits,
                            const char* field, const QString& expected, const char* message = "") {
            QTest::newRow(tag) << int(table) << edits << QString::fromUtf8(field) << expected
                               << QString::fromUtf8(message);
        };
        // clang-format off
        row("company by name", M::TN_WORKFORCE, {"company_id=Bau GmbH (Rohbau)"}, "company_id", "ID");
        row("duration 0:05", M::TN_EQUIPMENT, {"downtime=0:05"}, "downtime", "5");
        row("duration one-digit minutes refused", M::TN_EQUIPMENT, {"operating_time=0:5"}, "operating_time", "NULL");
        row("time 7", M::TN_TELEPHONE_NOTICE, {"time=7"}, "time", "07:00");
        row("time 7:5", M::TN_TELEPHONE_NOTICE, {"time=7:5"}, "time", "07:05");
        // The validator refuses the keystroke that would make the text invalid.
        row("time 25:00", M::TN_TELEPHONE_NOTICE, {"time=25:00"}, "time", "02:00");
        row("time 12:60", M::TN_TELEPHONE_NOTICE, {"time=12:60"}, "time", "12:06");
        row("date 1.2.15", M::TN_DELAY, {"date=1.2.15"}, "date", "2015-02-01");
        row("date 1.2.1999", M::TN_DELAY, {"date=1.2.1999"}, "date", "2099-02-01");
        row("invalid date", M::TN_DELAY, {"date=31.2.2020"}, "date", today, "Format-Fehler");
        row("text in a number cell", M::TN_CONSTRUCTION_MATERIAL, {"quantity=abc"}, "quantity", "NULL");
        row("decimal", M::TN_CONSTRUCTION_MATERIAL, {"quantity=12.5"}, "quantity", "12.5");
        row("empty comment", M::TN_ATTENDEE, {"comment="}, "comment", " ");
        row("blanks reduced", M::TN_CONCERN, {"description=a   b  c"}, "description", "a b c");
        row("one-line text", M::TN_EQUIPMENT, {"equipment=Bagger"}, "equipment", "Bagger");
        row("equipment over midnight", M::TN_EQUIPMENT, {"entry_time=22:00", "exit_time=6"}, "operating_time", "480");
        row("equipment exit cleared", M::TN_EQUIPMENT, {"entry_time=8", "exit_time=9", "exit_time="}, "entry_time", "NULL");
        row("duplicate deficiency", M::TN_DEFICIENCY, {"description=Riss", "description=Riss@1"}, "description@1", "B", "Mängeltabelle");
        row("spin box", M::TN_TIME_RECORDING, {"person_count=3"}, "person_count", "3");
        // clang-format on
    }

    void editCells()
    {
        QFETCH(int, table);
        QFETCH(QStringList, edits);
        QFETCH(QString, field);
        QFETCH(QString, expected);
        QFETCH(QString, message);
        M* model = showTable(M::TABLE_NAMES(table), 2);
        if (!message.isEmpty())
            m_prompt.expect(message);
        for (const QString& edit : edits) {
            const QString target = edit.section(QLatin1Char('='), 0, 0);
            QString text = edit.section(QLatin1Char('='), 1);
            // "@1" addresses the second row.
            const int row = text.endsWith(QLatin1String("@1")) ? 1 : 0;
            text.remove(QStringLiteral("@1"));
            typeIntoCell(m_view.get(), row, target, text);
        }
        const int row = field.endsWith(QLatin1String("@1")) ? 1 : 0;
        field.remove(QStringLiteral("@1"));
        if (expected == QLatin1String("ID"))
            expected = QString::number(m_companyId);
        QTRY_COMPARE(m_prompt.messages.size(), message.isEmpty() ? 0 : 1);
        QCOMPARE(valueText(model->data(row, field, Qt::EditRole)), expected);
        QVERIFY(model->submitAll());
    }

    // "Neu..." creates the company in the list its dialog chose and writes its id into the cell.
    void newCompany_data()
    {
        QTest::addColumn<int>("table");
        QTest::addColumn<bool>("person");
        QTest::addColumn<bool>("accept");
        QTest::addColumn<QString>("expected"); // category|company|type of the new row, or the cell's value
        QTest::newRow("company") << int(M::TN_WORKFORCE) << false << true << "2|Neubau AG|Maler";
        QTest::newRow("person of both lists") << int(M::TN_ATTENDEE) << true << true << "1|Neubau AG|Maler";
        QTest::newRow("cancelled") << int(M::TN_WORKFORCE) << false << false << "NULL";
    }

    void newCompany()
    {
        QFETCH(int, table);
        QFETCH(bool, person);
        QFETCH(bool, accept);
        QFETCH(QString, expected);
        QSettings().setValue(VDRCompanyDialog::dontShowDataProtectionMsgSettingsKey(), true);
        M* model = showTable(M::TABLE_NAMES(table), 1);
        const QModelIndex index = model->index(0, QStringLiteral("company_id"));
        m_view->setCurrentIndex(index);
        QTest::keyClick(m_view.get(), Qt::Key_F2);
        auto* combo = qobject_cast<QComboBox*>(m_view->indexWidget(index));
        QVERIFY(combo);
        QCOMPARE(combo->itemText(0), QStringLiteral("Neu..."));
        QTimer::singleShot(0, [=] {
            auto* dialog = qobject_cast<VDRCompanyDialog*>(QApplication::activeModalWidget());
            if (!dialog)
                return;
            if (person)
                dialog->findChild<QAbstractButton*>(QStringLiteral("radioButtonPerson"))->click();
            dialog->findChild<QLineEdit*>(QStringLiteral("lineEditCompany"))
                ->setText(QStringLiteral("Neubau AG"));
            dialog->findChild<QComboBox*>(QStringLiteral("comboBoxType"))
                ->setEditText(QStringLiteral("Maler"));
            accept ? dialog->accept() : dialog->reject();
        });
        combo->setCurrentIndex(0);
        emit combo->activated(0);
        QTRY_VERIFY(!m_view->indexWidget(index) || combo->currentText().isEmpty());
        if (!accept) {
            QCOMPARE(combo->currentText(), QString());
            QTest::keyClick(combo, Qt::Key_Escape);
            QCOMPARE(valueText(model->data(0, QStringLiteral("company_id"), Qt::EditRole)), expected);
            return;
        }
        const int id = model->data(0, QStringLiteral("company_id"), Qt::EditRole).toInt();
        QSqlQuery q(m_doc->database());
        QVERIFY(q.exec(QStringLiteral("SELECT category, company, type FROM company WHERE id = %1").arg(id)));
        QVERIFY(q.next());
        QCOMPARE(QStringList({q.value(0).toString(), q.value(1).toString(), q.value(2).toString()}).join('|'),
                 expected);
    }

    // What a cell shows for what it holds.
    void display_data()
    {
        QTest::addColumn<int>("table");
        QTest::addColumn<QString>("field");
        QTest::addColumn<QVariant>("value");
        QTest::addColumn<QString>("shown");
        QTest::newRow("duration") << int(M::TN_EQUIPMENT) << "operating_time" << QVariant(480) << "8:00";
        QTest::newRow("negative duration") << int(M::TN_EQUIPMENT) << "downtime" << QVariant(-65) << "-1:05";
        QTest::newRow("no images") << int(M::TN_DEFICIENCY) << "image_cnt" << QVariant(0) << "";
        QTest::newRow("images") << int(M::TN_DEFICIENCY) << "image_cnt" << QVariant(3) << "3";
        QTest::newRow("date") << int(M::TN_DELAY) << "date" << QVariant(QDate(2015, 2, 1)) << "01.02.2015";
        QTest::newRow("time") << int(M::TN_TELEPHONE_NOTICE) << "time" << QVariant(QTime(7, 5)) << "07:05";
        QTest::newRow("company") << int(M::TN_WORKFORCE) << "company_id" << QVariant(-1)
                                 << "Bau GmbH (Rohbau)";
        QTest::newRow("company unknown") << int(M::TN_WORKFORCE) << "company_id" << QVariant(999) << "";
    }

    void display()
    {
        QFETCH(int, table);
        QFETCH(QString, field);
        QFETCH(QVariant, value);
        QFETCH(QString, shown);
        M* model = showTable(M::TABLE_NAMES(table), 1);
        model->setData(0, field, value.toInt() == -1 ? QVariant(m_companyId) : value);
        QCOMPARE(m_view->vdrDelegate()->cellText(model->index(0, field)), shown);
    }

    // Clicks into the workforce totals and the deficiency images open their dialogs instead of an
    // editor; a double click below the rows adds one.
    void mouseShortcuts_data()
    {
        QTest::addColumn<int>("table");
        QTest::addColumn<QString>("field");
        QTest::addColumn<bool>("timeRecording");
        QTest::newRow("persons") << int(M::TN_WORKFORCE) << "person_count" << true;
        QTest::newRow("man-hours") << int(M::TN_WORKFORCE) << "man_hours" << true;
        QTest::newRow("images") << int(M::TN_DEFICIENCY) << "image_cnt" << false;
    }

    void mouseShortcuts()
    {
        QFETCH(int, table);
        QFETCH(QString, field);
        QFETCH(bool, timeRecording);
        M* model = showTable(M::TABLE_NAMES(table), 2);
        QSignalSpy times(m_view.get(), &VDRTableView::mouseClick4TimeRecording);
        QSignalSpy images(m_view.get(), &VDRTableView::mouseClick4DeficienyImageDialog);
        const QModelIndex index = model->index(1, field);
        QTest::mouseClick(m_view->viewport(), Qt::LeftButton, Qt::NoModifier,
                          m_view->visualRect(index).center());
        QSignalSpy& spy = timeRecording ? times : images;
        QCOMPARE(times.count() + images.count(), 1);
        QCOMPARE(spy.count(), 1);
        QCOMPARE(spy.at(0).at(0).toInt(), 1);
        QCOMPARE(spy.at(0).at(1).toInt(), model->data(1, QStringLiteral("id"), Qt::EditRole).toInt());
        QCOMPARE(spy.at(0).at(2).toInt(), kEntry);
        QVERIFY(!m_view->indexWidget(index));
        QSignalSpy added(m_view.get(), &VDRTableView::signalButtonAddClicked);
        QTest::mouseDClick(m_view->viewport(), Qt::LeftButton, Qt::NoModifier,
                           QPoint(5, m_view->viewport()->height() - 5));
        QCOMPARE(added.count(), 1);
    }

    // The enlarged table works on the same model, delegate and columns as the small one.
    void enlargedTable()
    {
        M* model = showTable(M::TN_CONCERN, 2);
        m_view->setAllColumnsHidden();
        m_view->setColumnHidden(QStringLiteral("description"), false);
        m_view->setColumnWidth(QStringLiteral("description"), VDRTableView::CWT_PERCENT, 100);
        VDRTableViewDialog dialog(m_view.get());
        QCOMPARE(dialog.view()->model(), model);
        QCOMPARE(dialog.view()->itemDelegate(), m_view->itemDelegate());
        for (int column = 0; column < model->columnCount(); ++column)
            QCOMPARE(dialog.view()->isColumnHidden(column), m_view->isColumnHidden(column));
        QSignalSpy added(m_view.get(), &VDRTableView::signalButtonAddClicked);
        dialog.view()->buttonAdd()->click();
        QCOMPARE(added.count(), 1);
        QVERIFY(dialog.view()->buttonBigview()->isHidden());
    }

    // A multi-line suggestion field learns its text when the edit is committed.
    void multiLineLearns()
    {
        M* model = showTable(M::TN_CONCERN, 1);
        typeIntoCell(m_view.get(), 0, QStringLiteral("description"), QStringLiteral("Geruest fehlt"));
        const int column = model->fieldIndex(QStringLiteral("description"));
        VDRCompleter list(VDRItemDelegate::registerIndexFor(M::TN_CONCERN), model->objectName(),
                          M::TN_CONCERN, model->headerData(column, Qt::Horizontal).toString(), column,
                          nullptr);
        QVERIFY(list.entries().contains(QStringLiteral("Geruest fehlt")));
    }

    // A file typed into a document cell is attached; removing the row marks the attachment removed.
    void documentOfRemovedRow()
    {
        const QString diary = m_dir.filePath(QStringLiteral("documents.vd2"));
        QVERIFY(createDiary(diary));
        m_doc = std::make_unique<VDRDocument>();
        bool showError = true;
        QVERIFY(m_doc->openDocument(diary, showError));
        QCOMPARE(queryTexts(diary, QStringLiteral("SELECT id FROM entry")),
                 QStringList{QString::number(kEntry)});
        const QString plan = m_dir.filePath(QStringLiteral("plan.pdf"));
        QFile file(plan);
        QVERIFY(file.open(QIODevice::WriteOnly) && file.write("%PDF") == 4);
        file.close();
        M* model = showTable(M::TN_CONSTRUCTION_MATERIAL, 1);
        typeIntoCell(m_view.get(), 0, QStringLiteral("document"), plan);
        QTRY_COMPARE(model->data(0, QStringLiteral("document"), Qt::EditRole).toString(),
                     QStringLiteral("plan.pdf"));
        const QString documents = VDRDocument::documentsDbPathFor(diary);
        QCOMPARE(queryTexts(documents, QStringLiteral("SELECT documentname, status FROM documents")),
                 QStringList{"plan.pdf|1"});
        m_view->setFlagAutodelete(true);
        m_view->selectRow(0);
        m_prompt.expect(QStringLiteral("Eintrag entfernen"), QString(), VDRPrompt::Yes);
        m_view->buttonDelete()->click();
        QCOMPARE(queryTexts(documents, QStringLiteral("SELECT documentname, status FROM documents")),
                 QStringList{"plan.pdf|3"});
    }

    // Assigning a photo to a deficiency counts the deficiency's photos, old and new.
    void photoRelation()
    {
        M* deficiencies = m_doc->modelEntryDfcy(kEntry);
        fill(deficiencies, 2, QStringLiteral("A"));
        M* photos = showTable(M::TN_PHOTO_DEFICIENCY, 0);
        QVERIFY(m_doc->appendEntryPhoto2(kEntry, QDate::currentDate(), QStringLiteral("Bild"), 0));
        const QModelIndex index = photos->index(0, QStringLiteral("relation_id"));
        const auto pick = [&](int row) {
            m_view->setCurrentIndex(index);
            QTest::keyClick(m_view.get(), Qt::Key_F2);
            auto* picker = qobject_cast<VDRTextEditComboBox*>(m_view->indexWidget(index));
            QVERIFY(picker);
            picker->showList();
            picker->listView()->setCurrentIndex(picker->model()->index(row));
            QTest::keyClick(picker->listView(), Qt::Key_Return);
            QTRY_VERIFY(!m_view->indexWidget(index));
        };
        const auto counts = [&] {
            return QStringList{valueText(deficiencies->data(0, QStringLiteral("image_cnt"), Qt::EditRole)),
                               valueText(deficiencies->data(1, QStringLiteral("image_cnt"), Qt::EditRole))};
        };
        pick(1);
        QCOMPARE(photos->data(0, QStringLiteral("relation_id"), Qt::EditRole),
                 deficiencies->data(1, QStringLiteral("id"), Qt::EditRole));
        QCOMPARE(counts(), QStringList({"0", "1"}));
        QCOMPARE(m_view->vdrDelegate()->cellText(index), QStringLiteral("B"));
        pick(0);
        QCOMPARE(counts(), QStringList({"1", "0"}));
    }

    // A megabyte pasted into a cell is stored (or cut by a one-line field) and drawn without a freeze.
    void hugePaste_data()
    {
        QTest::addColumn<int>("table");
        QTest::addColumn<QString>("field");
        QTest::addColumn<int>("storedLength");
        QTest::newRow("multi-line") << int(M::TN_ATTENDEE) << "comment" << 1024 * 1024;
        QTest::newRow("one-line") << int(M::TN_EQUIPMENT) << "equipment" << 32767;
        QTest::newRow("time") << int(M::TN_TELEPHONE_NOTICE) << "time" << -1;
    }

    void hugePaste()
    {
        QFETCH(int, table);
        QFETCH(QString, field);
        QFETCH(int, storedLength);
        M* model = showTable(M::TABLE_NAMES(table), 1);
        const QVariant before = model->data(0, field, Qt::EditRole);
        typeIntoCell(m_view.get(), 0, field, QString(1024 * 1024, QLatin1Char('x')), true);
        const QVariant after = model->data(0, field, Qt::EditRole);
        if (storedLength < 0)
            QCOMPARE(after.toTime().toString(QStringLiteral("hh:mm")),
                     before.toTime().toString(QStringLiteral("hh:mm")));
        else
            QCOMPARE(after.toString().size(), storedLength);
        QVERIFY(!m_view->grab().isNull());
        QVERIFY(model->submitAll());
    }

    // Percent columns share what fixed and unlisted columns leave.
    void columnWidths_data()
    {
        QTest::addColumn<int>("fixedPixels");
        QTest::newRow("50/50") << 0;
        QTest::newRow("50/50 and 70 px") << 70;
    }

    void columnWidths()
    {
        QFETCH(int, fixedPixels);
        showTable(M::TN_EQUIPMENT, 0);
        m_view->setAllColumnsHidden();
        m_view->setColumnHidden(QStringLiteral("equipment"), false);
        m_view->setColumnHidden(QStringLiteral("comment"), false);
        m_view->setColumnWidth(QStringLiteral("equipment"), VDRTableView::CWT_PERCENT, 50);
        m_view->setColumnWidth(QStringLiteral("comment"), VDRTableView::CWT_PERCENT, 50);
        if (fixedPixels) {
            m_view->setColumnHidden(QStringLiteral("entry_time"), false);
            m_view->setColumnWidth(QStringLiteral("entry_time"), VDRTableView::CWT_PIXEL, fixedPixels);
        }
        m_view->resizeColumns();
        const int share = (m_view->viewport()->width() - fixedPixels) * 50 / 100;
        QCOMPARE(m_view->columnWidth(m_view->getColumnIndex("equipment")), share);
        QCOMPARE(m_view->columnWidth(m_view->getColumnIndex("comment")), share);
        if (fixedPixels)
            QCOMPARE(m_view->columnWidth(m_view->getColumnIndex("entry_time")), fixedPixels);
    }

    // Removing a row takes what belongs to it along.
    void removalCascades_data()
    {
        QTest::addColumn<int>("table");
        QTest::addColumn<QString>("dependents");
        QTest::addColumn<QStringList>("expected");
        // clang-format off
        QTest::newRow("workforce") << int(M::TN_WORKFORCE) << "SELECT workforce_id FROM entry_time_recording ORDER BY id" << QStringList{"OTHER"};
        QTest::newRow("deficiency") << int(M::TN_DEFICIENCY) << "SELECT relation_id FROM entry_photo ORDER BY id" << QStringList{"-1", "OTHER"};
        // clang-format on
    }

    void removalCascades()
    {
        QFETCH(int, table);
        QFETCH(QString, dependents);
        QFETCH(QStringList, expected);
        M* model = showTable(M::TABLE_NAMES(table), 2);
        const int removedId = model->data(0, QStringLiteral("id"), Qt::EditRole).toInt();
        const int otherId = model->data(1, QStringLiteral("id"), Qt::EditRole).toInt();
        if (table == M::TN_WORKFORCE) {
            QVERIFY(m_doc->appendEntryTimeRecording(kEntry, removedId));
            QVERIFY(m_doc->appendEntryTimeRecording(kEntry, removedId));
            QVERIFY(m_doc->appendEntryTimeRecording(kEntry, otherId));
            QVERIFY(m_doc->modelEntryTimeRecording(kEntry)->submitAll());
        } else {
            M* photos = m_doc->modelEntryPhoto2(kEntry);
            for (int id : {removedId, otherId}) {
                QVERIFY(m_doc->appendEntryPhoto2(kEntry, QDate::currentDate(), QStringLiteral("Bild"), 0));
                photos->setData(photos->rowCount() - 1, QStringLiteral("relation_id"), id);
            }
            QVERIFY(photos->submitAll());
            model->setData(0, QStringLiteral("image_cnt"), 1);
        }
        m_view->setFlagAutodelete(true);
        m_view->selectRow(0);
        QSignalSpy removed(m_view.get(), &VDRTableView::signalButtonDeleteClicked);
        m_prompt.expect(QStringLiteral("Eintrag entfernen"), QString(), VDRPrompt::Yes);
        QTest::mouseClick(m_view->buttonDelete(), Qt::LeftButton);
        QCOMPARE(removed.count(), 1);
        QVERIFY(m_view->isRowHidden(0));
        QVERIFY(model->submitAll());
        expected.replaceInStrings(QStringLiteral("OTHER"), QString::number(otherId));
        QCOMPARE(textsOn(m_doc->database(), dependents), expected);
        QCOMPARE(model->rowCount(), 1);
    }

    // A locked report: no editor opens, no drop lands, no row is added; unlocked, all is back.
    void lockedReport()
    {
        M* model = showTable(M::TN_CONCERN, 3);
        VDRTableView companies;
        companies.setModel(m_doc->modelCompany2());
        VdEventsController::instance()->send_event(VdEvent::EnableEditors, false);
        QTRY_VERIFY(!m_view->editorsEnabled());
        QVERIFY(companies.editorsEnabled());
        const QModelIndex index = model->index(0, QStringLiteral("description"));
        m_view->setCurrentIndex(index);
        QTest::keyClick(m_view.get(), Qt::Key_F2);
        QVERIFY(!m_view->indexWidget(index));
        QSignalSpy added(m_view.get(), &VDRTableView::signalButtonAddClicked);
        QTest::mouseDClick(m_view->viewport(), Qt::LeftButton, Qt::NoModifier,
                           QPoint(5, m_view->viewport()->height() - 5));
        QCOMPARE(added.count(), 0);
        QVERIFY(!drop(m_view.get(), model, {0}));
        QCOMPARE(positions(model), QStringList({"A|1", "B|2", "C|3"}));

        VdEventsController::instance()->send_event(VdEvent::EnableEditors, true);
        QTRY_VERIFY(m_view->editorsEnabled());
        QTest::keyClick(m_view.get(), Qt::Key_F2);
        QVERIFY(m_view->indexWidget(index));
    }

    // Rows move by their pos; photos move only as one block.
    void dragAndDrop_data()
    {
        QTest::addColumn<int>("table");
        QTest::addColumn<QList<int>>("rows");
        QTest::addColumn<QStringList>("expected");
        QTest::addColumn<QString>("message");
        // clang-format off
        QTest::newRow("rows 2-3 of 5 to the end") << int(M::TN_CONCERN) << QList<int>{1, 2} << QStringList{"A|1", "D|2", "E|3", "B|4", "C|5"} << "";
        QTest::newRow("photos not one block")
            << int(M::TN_PHOTO_PROGRESS) << QList<int>{0, 2} << QStringList{"A|1", "B|2", "C|3", "D|4", "E|5"}
            << "Drag&Drop-Fehler";
        QTest::newRow("photo block") << int(M::TN_PHOTO_PROGRESS) << QList<int>{0, 1} << QStringList{"C|1", "D|2", "E|3", "A|4", "B|5"} << "";
        // clang-format on
    }

    void dragAndDrop()
    {
        QFETCH(int, table);
        QFETCH(QList<int>, rows);
        QFETCH(QStringList, expected);
        QFETCH(QString, message);
        M* model = showTable(M::TABLE_NAMES(table), 5);
        if (!message.isEmpty())
            m_prompt.expect(message, QStringLiteral("geschlossene Bereiche"));
        drop(m_view.get(), model, rows);
        QCOMPARE(positions(model), expected);
        QCOMPARE(m_prompt.messages.size(), message.isEmpty() ? 0 : 1);
    }

    // A delay dropped on the obstructions becomes an obstruction at the drop place.
    void dropOnAnotherType()
    {
        M* delays = showTable(M::TN_DELAY, 2);
        DropView obstructionView;
        M* obstructions = m_doc->modelEntryObstruction(kEntry);
        fill(obstructions, 1, QStringLiteral("X"));
        obstructionView.setModel(obstructions);
        obstructionView.resize(600, 300);
        obstructionView.show();
        QVERIFY(QTest::qWaitForWindowExposed(&obstructionView));
        QVERIFY(drop(&obstructionView, delays, {1}));
        QCOMPARE(positions(delays), QStringList{"A|1"});
        QCOMPARE(positions(obstructions), QStringList({"X|1", "B|2"}));
    }

    // Metrics are kept per report, and only by views that keep them; events 1003 and 1006 reach only
    // the views they concern.
    void metricsPerReport()
    {
        M* model = showTable(M::TN_CONCERN, 2);
        Q_UNUSED(model)
        m_view->setSaveMetricsFlag(true);
        m_view->setRowHeight(0, 77);
        VdEventsController::instance()->send_event(VdEvent::SaveMetrics, kEntry);
        QTRY_VERIFY(m_view->hasMetrics(kEntry));
        m_view->setRowHeight(0, 20);
        VdEventsController::instance()->send_event(VdEvent::RestoreMetrics, kEntry);
        QTRY_COMPARE(m_view->rowHeight(0), 77);
        m_view->setSaveMetricsFlag(false);
        VdEventsController::instance()->send_event(VdEvent::SaveMetrics, 99);
        QVERIFY(!m_view->hasMetrics(99));
        // Row selection is the report list's; a report's lists keep theirs.
        QVERIFY(m_doc->appendEntry() > 0);
        VDRTableView reports;
        reports.setModel(m_doc->modelEntryAll());
        m_view->set_current_row(0);
        VdEventsController::instance()->send_event(VdEvent::SelectRow, 1);
        QTRY_COMPARE(reports.currentIndex().row(), 1);
        QCOMPARE(m_view->currentIndex().row(), 0);
    }

    // The time recording: the totals of its rows go into the workforce row on OK.
    void timeRecording_data()
    {
        QTest::addColumn<QStringList>("rows"); // count|type|from|to|breaks
        QTest::addColumn<QString>("typedHours");
        QTest::addColumn<QString>("manHours");
        QTest::addColumn<int>("persons");
        QTest::addColumn<QString>("types");
        // clang-format off
        QTest::newRow("3 persons 07:00-16:30, 30 min") << QStringList{"3|Maurer|7|16:30|30"} << "" << "27" << 3 << "Maurer";
        QTest::newRow("over midnight") << QStringList{"1|Polier|22:00|6|"} << "" << "8" << 1 << "Polier";
        QTest::newRow("same time twice") << QStringList{"2||8|8|"} << "" << "0" << 2 << "";
        QTest::newRow("no times") << QStringList{"2|Helfer|||", "1|Helfer|||"} << "" << "NULL" << 3 << "Helfer";
        QTest::newRow("types united") << QStringList{"1|Maurer|||", "1|Helfer|||", "1|Maurer|||", "1||||"} << "" << "NULL" << 4 << "Maurer, Helfer";
        QTest::newRow("typed hours clear the times") << QStringList{"2|Maurer|7|9|"} << "5" << "5" << 2 << "Maurer";
        // clang-format on
    }

    void timeRecording()
    {
        QFETCH(QStringList, rows);
        QFETCH(QString, typedHours);
        QFETCH(QString, manHours);
        QFETCH(int, persons);
        QFETCH(QString, types);
        QVERIFY(m_doc->appendEntryWorkforce(kEntry));
        M* workforce = m_doc->modelEntryWorkforce(kEntry);
        const int workforceId = workforce->data(0, QStringLiteral("id"), Qt::EditRole).toInt();
        VDRTimeRecordingWidget dialog;
        dialog.setDocument(m_doc.get());
        dialog.setEntryID(kEntry);
        dialog.setWorkforceID(workforceId);
        QVERIFY(dialog.prepare());
        dialog.show();
        QVERIFY(QTest::qWaitForWindowExposed(&dialog));
        VDRTableView* view = dialog.view();
        const QStringList fields = {"person_count", "person_type", "time_from", "time_to", "breaks"};
        for (int row = 0; row < rows.size(); ++row) {
            dialog.slot_addButtonClicked();
            const QStringList values = rows.at(row).split(QLatin1Char('|'));
            for (int i = 0; i < fields.size(); ++i) {
                if (!values.at(i).isEmpty())
                    typeIntoCell(view, row, fields.at(i), values.at(i));
            }
        }
        M* times = m_doc->modelEntryTimeRecording(kEntry);
        if (typedHours == QLatin1String("remove")) {
            view->selectRow(0);
            m_prompt.expect(QStringLiteral("Eintrag entfernen"), QString(), VDRPrompt::Yes);
            view->buttonDelete()->click();
            rows.removeFirst();
        } else if (!typedHours.isEmpty()) {
            typeIntoCell(view, 0, QStringLiteral("hours"), typedHours);
            QCOMPARE(valueText(times->data(0, QStringLiteral("time_from"), Qt::EditRole)),
                     QStringLiteral("NULL"));
        }
        QCOMPARE(dialog.totalField()->text(), manHours == QLatin1String("NULL")
                                                  ? QString()
                                                  : QLocale().toString(manHours.toDouble(), 'f', 2));
        dialog.accept();
        QCOMPARE(QSettings().value(VDRTimeRecordingWidget::ColumnsSettingsKey).toList().size(), 6);
        dialog.writeWorkforceRow();
        QCOMPARE(valueText(workforce->data(0, QStringLiteral("man_hours"), Qt::EditRole)), manHours);
        QCOMPARE(workforce->data(0, QStringLiteral("person_count"), Qt::EditRole).toInt(), persons);
        QCOMPARE(workforce->data(0, QStringLiteral("person_type"), Qt::EditRole).toString(), types);
        QSqlQuery q(m_doc->database());
        QVERIFY(q.exec(QStringLiteral("SELECT count(*) FROM entry_time_recording")));
        QVERIFY(q.next());
        QCOMPARE(q.value(0).toInt(), rows.size());
    }

    // Cancel with changes asks; Abort keeps the dialog, OK discards the rows.
    void timeRecordingCancel()
    {
        QVERIFY(m_doc->appendEntryWorkforce(kEntry));
        VDRTimeRecordingWidget dialog;
        dialog.setDocument(m_doc.get());
        dialog.setEntryID(kEntry);
        dialog.setWorkforceID(
            m_doc->modelEntryWorkforce(kEntry)->data(0, QStringLiteral("id"), Qt::EditRole).toInt());
        QVERIFY(dialog.prepare());
        dialog.show();
        dialog.slot_addButtonClicked();
        QCOMPARE(dialog.view()->model()->rowCount(), 1);
        m_prompt.expect(QStringLiteral("Änderungen verwerfen"), QString(), VDRPrompt::Abort);
        dialog.reject();
        QVERIFY(dialog.isVisible());
        m_prompt.expect(QStringLiteral("Änderungen verwerfen"), QString(), VDRPrompt::Ok);
        dialog.reject();
        QVERIFY(!dialog.isVisible());
        QCOMPARE(dialog.view()->model()->rowCount(), 0);
    }

    // The picker snaps the minute to the nearest five; 58 and 59 check no minute.
    void timePicker_data()
    {
        QTest::addColumn<int>("minute");
        QTest::addColumn<int>("checked");
        QTest::newRow("2") << 2 << 0;
        QTest::newRow("3") << 3 << 5;
        QTest::newRow("57") << 57 << 55;
        QTest::newRow("58") << 58 << -1;
    }

    void timePicker()
    {
        QFETCH(int, minute);
        QFETCH(int, checked);
        VDRTimePickerWidget picker;
        picker.setTime(QTime(9, minute));
        picker.show();
        QVERIFY(picker.hourButton(9)->isChecked());
        for (int m = 0; m < 60; m += 5)
            QCOMPARE(picker.minuteButton(m)->isChecked(), m == checked);
        QSignalSpy ok(&picker, &VDRTimePickerWidget::okClicked);
        QTest::mouseClick(picker.hourButton(14), Qt::LeftButton);
        QTest::mouseClick(picker.minuteButton(35), Qt::LeftButton);
        QCOMPARE(ok.count(), 1);
        QCOMPARE(ok.at(0).at(0).toTime(), QTime(14, 35));
        QVERIFY(!picker.isVisible());
    }

private:
    // Shows a view on the report's model with 'rows' rows whose first text column reads A, B, C...
    M* showTable(M::TABLE_NAMES table, int rows)
    {
        M* model = m_doc->modelEntry(kEntry, table);
        fill(model, rows, QStringLiteral("A"));
        m_view = std::make_unique<DropView>();
        m_view->setModel(model);
        m_view->resize(800, 400);
        m_view->show();
        QApplication::setActiveWindow(m_view.get());
        if (!QTest::qWaitForWindowExposed(m_view.get()))
            qWarning("view not exposed");
        return model;
    }

    void fill(M* model, int rows, const QString& first)
    {
        for (int i = 0; i < rows; ++i) {
            const QString text(QChar(first.at(0).unicode() + i));
            using Append = bool (VDRDocument::*)(int);
            static const QHash<int, Append> appends = {
                {M::TN_ATTENDEE, &VDRDocument::appendEntryAttendee},
                {M::TN_WORKFORCE, &VDRDocument::appendEntryWorkforce},
                {M::TN_DELAY, &VDRDocument::appendEntryDelay},
                {M::TN_OBSTRUCTION, &VDRDocument::appendEntryObstruction},
                {M::TN_DEFICIENCY, &VDRDocument::appendEntryDfcy},
                {M::TN_CONSTRUCTION_MATERIAL, &VDRDocument::appendEntryConstructionmaterial},
                {M::TN_TELEPHONE_NOTICE, &VDRDocument::appendEntryTelephoneNotice},
                {M::TN_CONCERN, &VDRDocument::appendEntryConcern},
                {M::TN_EQUIPMENT, &VDRDocument::appendEntryEquipment}};
            const int table = model->tableNameId();
            const bool ok = table == M::TN_PHOTO_PROGRESS
                                ? m_doc->appendEntryPhoto1(kEntry, QDate::currentDate(), text, 0)
                            : table == M::TN_TIME_RECORDING ? m_doc->appendEntryTimeRecording(kEntry, 1)
                            : appends.contains(table)       ? (m_doc.get()->*appends.value(table))(kEntry)
                                                            : false;
            if (model->fieldIndex(QStringLiteral("description")) >= 0)
                model->setData(model->rowCount() - 1, QStringLiteral("description"), text);
            QVERIFY(ok);
        }
        QVERIFY2(model->submitAll(), qPrintable(model->lastError().text()));
    }

    // "text|pos" per row, in the model's order.
    QStringList positions(M* model)
    {
        model->fetch_all();
        const QString field = model->fieldIndex(QStringLiteral("caption")) >= 0
                                  ? QStringLiteral("caption")
                                  : QStringLiteral("description");
        QStringList result;
        for (int row = 0; row < model->rowCount(); ++row)
            result << model->data(row, field, Qt::EditRole).toString() + QLatin1Char('|') +
                          model->data(row, QStringLiteral("pos"), Qt::EditRole).toString();
        return result;
    }

    // Drops rows of 'source' below the last row of 'view', as a drag would.
    bool drop(VDRTableView* view, M* source, const QList<int>& rows)
    {
        QModelIndexList indexes;
        for (int row : rows)
            indexes << source->index(row, 0);
        std::unique_ptr<QMimeData> data(source->mimeData(indexes));
        const int last = view->model()->rowCount() - 1;
        const QPoint below(5, last < 0 ? 5 : view->rowViewportPosition(last) + view->rowHeight(last) + 5);
        QDropEvent event(below, Qt::MoveAction, data.get(), Qt::LeftButton, Qt::NoModifier);
        // Delivered the way the view's viewport passes it on; a synthetic drop never reaches it
        // through the application, which only takes drops from a running drag.
        static_cast<DropView*>(view)->dropEvent(&event);
        return event.isAccepted();
    }

    std::unique_ptr<VDRDocument> m_doc;
    std::unique_ptr<VDRTableView> m_view;
    int m_companyId = 0;
};

QTEST_MAIN(TestVDRTableView)
#include "tst_vdrtableview.moc"
