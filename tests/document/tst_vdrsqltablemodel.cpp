#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"

#include <QSqlError>
#include <QSqlField>
#include <QSqlQuery>
#include <QSqlRecord>
#include <QTimer>
#include <QtTest>

#include <memory>

// Data rows name the document's accessor they test.
using Accessor = VDRSqlTableModel* (*)(VDRDocument*, int);
Q_DECLARE_METATYPE(Accessor)
#define PER_REPORT(name) Accessor([](VDRDocument* d, int id) -> VDRSqlTableModel* { return d->name(id); })
#define WHOLE_DIARY(name) Accessor([](VDRDocument* d, int) -> VDRSqlTableModel* { return d->name(); })

// Values for every column of a new row, so that NOT NULL columns are satisfied.
static QHash<QString, QVariant> newRow(VDRSqlTableModel* m, int entryId)
{
    QHash<QString, QVariant> values;
    const QSqlRecord rec = m->record();
    const int type = VDRSqlTableModel::typeCondition(m->tableNameId());
    for (int c = 0; c < rec.count(); ++c) {
        const QString name = rec.fieldName(c);
        if (name == QLatin1String("id"))
            continue;
        else if (name == QLatin1String("entry_id"))
            values[name] = entryId;
        else if (name == QLatin1String("type"))
            values[name] = type;
        else if (name == QLatin1String("category"))
            values[name] = m->tableNameId() == VDRSqlTableModel::TN_COMPANY2 ? 2 : 1;
        else if (name == QLatin1String("pos"))
            values[name] = m->maxPos() + 1;
        else if (m->type(c) == QVariant::Date)
            values[name] = QDate(2024, 1, 2);
        else if (m->type(c) == QVariant::Time)
            values[name] = QTime(8, 0);
        else if (rec.field(c).type() == QVariant::String)
            values[name] = QStringLiteral(" ");
        else
            values[name] = 0;
    }
    return values;
}

class TestVDRSqlTableModel : public VDRTestCase
{
    Q_OBJECT

    void initRun() override { qRegisterMetaType<QList<QDate>>(); }
    void initTest() override
    {
        m_doc = std::make_unique<VDRDocument>();
        QVERIFY(m_doc->createDocument(true));
    }
    void cleanupTest() override
    {
        if (m_doc)
            m_doc->closeDocument();
        m_doc.reset();
    }

private slots:
    void idsCountPerTable_data()
    {
        QTest::addColumn<Accessor>("accessor");
        QTest::addColumn<QString>("table");
        QTest::addColumn<int>("firstId");
        QTest::newRow("no counter yet")
            << PER_REPORT(modelEntryDelay) << QStringLiteral("entry_progress") << 1;
        QTest::newRow("photos count apart")
            << PER_REPORT(modelEntryPhoto3) << QStringLiteral("entry_photo") << 1;
        QTest::newRow("company counter of the new diary")
            << WHOLE_DIARY(modelCompany2) << QStringLiteral("company") << 4;
    }

    void idsCountPerTable()
    {
        QFETCH(Accessor, accessor);
        QFETCH(QString, table);
        QFETCH(int, firstId);
        const QString otherCounters =
            QStringLiteral("SELECT group_concat(id_table || '=' || id_counter) FROM "
                           "(SELECT * FROM id_generator WHERE id_table <> '%1' ORDER BY 1)")
                .arg(table);
        const QVariant othersBefore = query(otherCounters);
        if (firstId == 1)
            QVERIFY(counter(table).isNull());

        VDRSqlTableModel* m = accessor(m_doc.get(), 1);
        QVERIFY(m->appendRow(newRow(m, 1)));
        QCOMPARE(counter(table).toInt(), firstId);
        QVERIFY(m->appendRow(newRow(m, 1)));
        QCOMPARE(counter(table).toInt(), firstId + 1);
        QVERIFY(m->submitAll());

        QVERIFY(m->rowById(firstId) >= 0);
        QVERIFY(m->rowById(firstId + 1) >= 0);
        QCOMPARE(query(otherCounters), othersBefore);
    }

    void idsNeverReused_data()
    {
        QTest::addColumn<QString>("action");
        QTest::addColumn<int>("expectedId");
        QTest::newRow("highest deleted and submitted") << "delete" << 4;
        QTest::newRow("unsubmitted row reverted") << "revert" << 5;
        QTest::newRow("highest deleted, diary saved and reopened") << "reopen" << 4;
    }

    void idsNeverReused()
    {
        QFETCH(QString, action);
        QFETCH(int, expectedId);
        VDRSqlTableModel* m = m_doc->modelEntryDelay(1);
        for (int i = 0; i < 3; ++i)
            QVERIFY(m->appendRow(newRow(m, 1)));
        QVERIFY(m->submitAll());
        QCOMPARE(m->last_id(), 3);

        if (action == QLatin1String("revert")) {
            QVERIFY(m->appendRow(newRow(m, 1)));
            m->revertAll();
        } else {
            QVERIFY(m->removeRow(m->rowById(3)));
            QVERIFY(m->submitAll());
            QCOMPARE(m->last_id(), 2);
        }
        if (action == QLatin1String("reopen")) {
            const QString path = m_dir.filePath(QStringLiteral("reopen.vd2"));
            QVERIFY(m_doc->writeWorkingCopyTo(path));
            QVERIFY(m_doc->closeDocument());
            bool showError = false;
            QVERIFY(m_doc->openDocument(path, showError));
            m = m_doc->modelEntryDelay(1);
        }
        QVERIFY(m->appendRow(newRow(m, 1)));
        QVERIFY(m->submitAll());
        QCOMPARE(m->last_id(), expectedId);
    }

    void reportModelsBuiltOnce()
    {
        QVERIFY(!m_doc->hasEntryModels(1));
        const int modelsBefore = m_doc->findChildren<VDRSqlTableModel*>().size();
        VDRSqlTableModel* first = m_doc->modelEntryPhoto3(1);
        QVERIFY(first);
        const int modelsOfOneReport = m_doc->findChildren<VDRSqlTableModel*>().size();
        QVERIFY(modelsOfOneReport > modelsBefore);

        QCOMPARE(m_doc->modelEntryPhoto3(1), first);
        QCOMPARE(m_doc->findChildren<VDRSqlTableModel*>().size(), modelsOfOneReport);

        VDRSqlTableModel* other = m_doc->modelEntryPhoto3(2);
        QVERIFY(other && other != first);
        QCOMPARE(m_doc->findChildren<VDRSqlTableModel*>().size(), 2 * modelsOfOneReport - modelsBefore);
    }

    void reportModelFilters_data()
    {
        QTest::addColumn<Accessor>("accessor");
        QTest::addColumn<QString>("table");
        QTest::addColumn<int>("type");
        QTest::addColumn<QString>("name");
        auto row = [](const char* tag, Accessor a, const char* table, int type, const QString& name) {
            QTest::newRow(tag) << a << QString::fromLatin1(table) << type << name;
        };
        row("delay", PER_REPORT(modelEntryDelay), "entry_progress", 1, QStringLiteral("Verzüge"));
        row("obstruction", PER_REPORT(modelEntryObstruction), "entry_progress", 2,
            QStringLiteral("Behinderungen"));
        row("acceptance", PER_REPORT(modelEntryAcceptance), "entry_progress", 3, QStringLiteral("Abnahmen"));
        row("deficiency", PER_REPORT(modelEntryDfcy), "entry_progress", 4, QStringLiteral("Mängel"));
        row("photos 1", PER_REPORT(modelEntryPhoto1), "entry_photo", 1,
            QStringLiteral("Bilder Leistungsstand"));
        row("photos 2", PER_REPORT(modelEntryPhoto2), "entry_photo", 2, QStringLiteral("Bilder Mängel"));
        row("photos 3", PER_REPORT(modelEntryPhoto3), "entry_photo", 3,
            QStringLiteral("Bilder Behinderungen"));
        row("photos 4", PER_REPORT(modelEntryPhoto4), "entry_photo", 4,
            QStringLiteral("Bilder Baumaßnahmen"));
        row("photos 5", PER_REPORT(modelEntryPhoto5), "entry_photo", 5, QStringLiteral("Bilder Baustoffe"));
        row("directive", PER_REPORT(modelEntryDirective), "entry_task", 1, QStringLiteral("Weisungen"));
        row("auxiliary", PER_REPORT(modelEntryAuxiliaryservice), "entry_task", 2,
            QStringLiteral("Zusatzleistungen"));
        row("workforce", PER_REPORT(modelEntryWorkforce), "entry_workforce", 0,
            QStringLiteral("Bau-Besetzung"));
        row("equipment", PER_REPORT(modelEntryEquipment), "entry_equipment", 0,
            QStringLiteral("Geräte und Maschinen"));
    }

    void reportModelFilters()
    {
        QFETCH(Accessor, accessor);
        QFETCH(QString, table);
        QFETCH(int, type);
        QFETCH(QString, name);
        // Rows of two reports and every type, pos written in descending order; the text names each row.
        QVERIFY(m_doc->appendEntry() == 1 && m_doc->modelEntryAll()->submitAll());
        VDRSqlTableModel* probe = accessor(m_doc.get(), 99);
        const QString textField =
            probe->record().contains(QStringLiteral("description")) ? QStringLiteral("description")
            : probe->record().contains(QStringLiteral("caption"))   ? QStringLiteral("caption")
                                                                    : QStringLiteral("comment");
        for (int entry = 1; entry <= 2; ++entry) {
            for (int t = (type ? 1 : 0); t <= (type ? 5 : 0); ++t) {
                for (int pos = 3; pos >= 1; --pos) {
                    QHash<QString, QVariant> values = newRow(probe, entry);
                    values[QStringLiteral("pos")] = pos;
                    if (type)
                        values[QStringLiteral("type")] = t;
                    values[textField] = QStringLiteral("e%1t%2p%3").arg(entry).arg(t).arg(pos);
                    QVERIFY(probe->appendRow(values));
                }
            }
        }
        // Written through a model of another report, so every row leaves its filter on submit.
        QVERIFY(probe->submitAll());
        QCOMPARE(probe->rowCount(), 0);

        for (int entry = 1; entry <= 2; ++entry) {
            VDRSqlTableModel* m = accessor(m_doc.get(), entry);
            QCOMPARE(m->objectName(), name);
            QCOMPARE(m->tableName(), table);
            QStringList texts;
            for (int row = 0; row < m->rowCount(); ++row)
                texts << m->data(row, textField).toString();
            const QString prefix = QStringLiteral("e%1t%2p").arg(entry).arg(type);
            QCOMPARE(texts, QStringList({prefix + '1', prefix + '2', prefix + '3'}));
        }
    }

    void companyLists_data()
    {
        QTest::addColumn<Accessor>("accessor");
        QTest::addColumn<QList<int>>("categories");
        QTest::addColumn<QString>("name");
        QTest::newRow("list 1") << WHOLE_DIARY(modelCompany1) << QList<int>{-1, 1, 1, 1, 1}
                                << QStringLiteral("Firma1");
        QTest::newRow("list 2") << WHOLE_DIARY(modelCompany2) << QList<int>{-2, 2}
                                << QStringLiteral("Firma2");
    }

    void companyLists()
    {
        QFETCH(Accessor, accessor);
        QFETCH(QList<int>, categories);
        QFETCH(QString, name);
        int id = 100;
        for (int category : {2, -1, -2, 1, 12, 0})
            exec(QStringLiteral(
                     "INSERT INTO company VALUES (%1, %2, 't', '', '', '', '', '', '', '', '', '', '', 1)")
                     .arg(++id)
                     .arg(category));
        VDRSqlTableModel* m = accessor(m_doc.get(), 0);
        QCOMPARE(m->objectName(), name);
        QVERIFY(m->select());
        QList<int> shown;
        for (int row = 0; row < m->rowCount(); ++row)
            shown << m->data(row, QStringLiteral("category")).toInt();
        std::sort(shown.begin(), shown.end());
        QCOMPARE(shown, categories);
    }

    void lookups_data()
    {
        QTest::addColumn<int>("rows");
        QTest::newRow("empty") << 0;
        QTest::newRow("few") << 3;
        // More rows than the driver hands over in one fetch.
        QTest::newRow("many") << 600;
    }

    void lookups()
    {
        QFETCH(int, rows);
        if (rows > 0)
            exec(
                QStringLiteral("WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM n WHERE i < %1) "
                               "INSERT INTO entry_progress (id, entry_id, pos, type, description, roomname, "
                               "roombook_number) SELECT 1000 + i, 1, i, 1, 'd' || i, '', '' FROM n")
                    .arg(rows));
        VDRSqlTableModel* m = m_doc->modelEntryDelay(1);
        const int lastId = rows ? 1000 + rows : 0;
        QCOMPARE(m->last_id(), lastId);
        QCOMPARE(m->maxPos(), rows);
        QCOMPARE(m->rowById(999), -1);
        QVERIFY(m->dataById(999, QStringLiteral("description")).isNull());
        QVERIFY(!m->setDataById(999, QStringLiteral("roomname"), QStringLiteral("R")));
        QCOMPARE(m_doc->modelMeta()->maxPos(), 0);
        if (!rows)
            return;

        const int row = m->rowById(lastId);
        QVERIFY(row >= 0);
        QCOMPARE(m->data(row, QStringLiteral("id")).toInt(), lastId);
        QCOMPARE(m->record_position(QStringLiteral("description"), QStringLiteral("d%1").arg(rows)), row);
        QCOMPARE(m->record_position(QStringLiteral("description"), QStringLiteral("none")), -1);
        QCOMPARE(m->dataById(lastId, QStringLiteral("pos")).toInt(), rows);

        QVERIFY(m->setDataById(lastId, QStringLiteral("roomname"), QStringLiteral("R 1.04")));
        QCOMPARE(m->dataById(lastId, QStringLiteral("roomname")).toString(), QStringLiteral("R 1.04"));
        QVERIFY(m->submitAll());
        QCOMPARE(
            query(QStringLiteral("SELECT roomname FROM entry_progress WHERE id = %1").arg(lastId)).toString(),
            QStringLiteral("R 1.04"));
    }

    void nestedTransactions_data()
    {
        QTest::addColumn<int>("begins");
        QTest::addColumn<int>("ends");
        QTest::addColumn<bool>("committed");
        QTest::newRow("one pair") << 1 << 1 << true;
        QTest::newRow("inner pair closed only") << 2 << 1 << false;
        QTest::newRow("both pairs closed") << 2 << 2 << true;
        QTest::newRow("three deep, two closed") << 3 << 2 << false;
        QTest::newRow("one end too many") << 1 << 2 << true;
    }

    void nestedTransactions()
    {
        QFETCH(int, begins);
        QFETCH(int, ends);
        QFETCH(bool, committed);
        for (int i = 0; i < begins; ++i)
            m_doc->beginTransaction();
        exec(QStringLiteral("INSERT INTO meta (key, value) VALUES ('probe', 'x')"));
        for (int i = 0; i < ends; ++i)
            m_doc->endTransaction();
        QCOMPARE(m_doc->transactionDepth(), std::max(0, begins - ends));

        // Writing the copy closes the connection, which drops whatever was not committed.
        const QString path = m_dir.filePath(QStringLiteral("transactions.vd2"));
        QFile::remove(path);
        QVERIFY(m_doc->writeWorkingCopyTo(path));
        QCOMPARE(m_doc->transactionDepth(), 0);
        QCOMPARE(
            VDRTestFixtures::queryValue(path, QStringLiteral("SELECT value FROM meta WHERE key = 'probe'"))
                .isValid(),
            committed);
    }

    void reportDatesChanged()
    {
        VDRAllEntryTableModel* entries = m_doc->modelEntryAll();
        QCOMPARE(entries->objectName(), QString());
        QCOMPARE(m_doc->appendEntry(), 1);
        QVERIFY(entries->submitAll());
        QCOMPARE(entries->rowCount(), 2);

        // The dates are collected once the event loop runs: a zero timer queued after the edits has
        // fired only when every earlier one has, so waiting for it replaces a guessed sleep.
        QSignalSpy spy(entries, &VDRAllEntryTableModel::reportDatesChanged);
        const auto settle = [] {
            bool done = false;
            QTimer::singleShot(0, [&done] { done = true; });
            return QTest::qWaitFor([&done] { return done; });
        };
        QVERIFY(entries->setData(0, QStringLiteral("inspection_date"), QDate(2023, 5, 2)));
        QVERIFY(entries->setData(1, QStringLiteral("inspection_date"), QDate(2023, 5, 9)));
        QVERIFY(settle());
        QCOMPARE(spy.count(), 1);
        QList<QDate> dates = spy.last().first().value<QList<QDate>>();
        std::sort(dates.begin(), dates.end());
        QCOMPARE(dates, QList<QDate>({QDate(2023, 5, 2), QDate(2023, 5, 9)}));

        // Other columns leave the calendar alone.
        spy.clear();
        QVERIFY(entries->setData(0, QStringLiteral("progress"), QStringLiteral("Rohbau")));
        QVERIFY(settle());
        QCOMPARE(spy.count(), 0);
    }

    void submitShowsWhatIsStored_data()
    {
        QTest::addColumn<QString>("action");
        QTest::newRow("new row with SQLite's defaults") << "default";
        QTest::newRow("many new reports") << "append";
        QTest::newRow("report removed") << "remove";
        QTest::newRow("row moved by pos") << "move";
    }

    void submitShowsWhatIsStored()
    {
        QFETCH(QString, action);
        VDRSqlTableModel* m = nullptr;
        QString field, sql;
        if (action == QLatin1String("default")) {
            m = m_doc->modelVdr();
            QHash<QString, QVariant> values = newRow(m, 0);
            values.remove(QStringLiteral("address1")); // DEFAULT -1
            QVERIFY(m->appendRow(values));
            field = "address1";
            sql = "SELECT id, address1 FROM vdr ORDER BY id";
        } else if (action == QLatin1String("move")) {
            m = m_doc->modelEntryDelay(1);
            for (int i = 0; i < 3; ++i)
                QVERIFY(m_doc->appendEntryDelay(1));
            QVERIFY(m->submitAll());
            QVERIFY(m->setData(0, QStringLiteral("pos"), 9));
            field = "pos";
            sql = "SELECT id, pos FROM entry_progress WHERE entry_id = 1 AND type = 1 ORDER BY pos";
        } else {
            m = m_doc->modelEntryAll();
            m_doc->beginTransaction();
            for (int i = 0; i < 70; ++i) {
                QCOMPARE(m_doc->appendEntry(), 1);
                QVERIFY(m->submitAll());
            }
            m_doc->endTransaction();
            if (action == QLatin1String("remove"))
                QVERIFY(m->removeRows(3, 1));
            field = "number";
            sql = "SELECT id, number FROM entry ORDER BY id";
        }
        QVERIFY(m->submitAll());

        QStringList shown, stored;
        m->fetch_all();
        for (int r = 0; r < m->rowCount(); ++r)
            shown << m->data(r, QStringLiteral("id"), Qt::EditRole).toString() + QLatin1Char('|') +
                         m->data(r, field, Qt::EditRole).toString();
        QSqlQuery q(m_doc->database());
        QVERIFY(q.exec(sql));
        while (q.next())
            stored << q.value(0).toString() + QLatin1Char('|') + q.value(1).toString();
        QCOMPARE(shown, stored);
        if (action == QLatin1String("default"))
            QCOMPARE(shown.last(), QStringLiteral("2|-1"));
        else if (action != QLatin1String("move"))
            QCOMPARE(m_doc->maxEntryID(), shown.last().section(QLatin1Char('|'), 0, 0).toInt());
    }

    void datesAndTimesStoredAsIso_data()
    {
        QTest::addColumn<QString>("field");
        QTest::addColumn<QVariant>("value");
        QTest::addColumn<QVariant>("expected");
        const QDate day(2024, 2, 29);
        const QTime time(7, 5);
        const QDateTime moment(day, time);
        QTest::newRow("date") << QStringLiteral("inspection_date") << QVariant(day) << QVariant(day);
        QTest::newRow("date from a date-time")
            << QStringLiteral("inspection_date") << QVariant(moment) << QVariant(day);
        QTest::newRow("time") << QStringLiteral("inspection_time_from") << QVariant(time) << QVariant(time);
        QTest::newRow("time from a date-time")
            << QStringLiteral("inspection_time_to") << QVariant(moment) << QVariant(time);
    }

    void datesAndTimesStoredAsIso()
    {
        QFETCH(QString, field);
        QFETCH(QVariant, value);
        QFETCH(QVariant, expected);
        QVERIFY(m_doc->modelEntryAll()->setData(0, field, value));
        QVERIFY(m_doc->modelEntryAll()->submitAll());

        const QString path = m_dir.filePath(QStringLiteral("iso.vd2"));
        QFile::remove(path);
        QVERIFY(m_doc->writeWorkingCopyTo(path));
        const QString stored =
            VDRTestFixtures::queryValue(path, QStringLiteral("SELECT %1 FROM entry WHERE id = 1").arg(field))
                .toString();
        if (expected.type() == QVariant::Date)
            QCOMPARE(stored, expected.toDate().toString(Qt::ISODate));
        else
            QCOMPARE(QTime::fromString(stored, Qt::ISODateWithMs), expected.toTime());
    }

private:
    void exec(const QString& sql) { QVERIFY(VDRTestFixtures::execOn(m_doc->database(), {sql})); }

    // On the document's own connection: the working copy is locked against any other.
    QVariant query(const QString& sql)
    {
        QSqlQuery q(m_doc->database());
        return q.exec(sql) && q.next() ? q.value(0) : QVariant();
    }

    QVariant counter(const QString& table)
    {
        return query(QStringLiteral("SELECT id_counter FROM id_generator WHERE id_table = '%1'").arg(table));
    }

    std::unique_ptr<VDRDocument> m_doc;
};

QTEST_MAIN(TestVDRSqlTableModel)
#include "tst_vdrsqltablemodel.moc"
