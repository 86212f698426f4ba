#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"

#include <QDir>
#include <QRegularExpression>
#include <QSqlQuery>
#include <QtTest>

#include <functional>

using namespace VDRTestFixtures;

namespace {
const QString kMaterial = QStringLiteral("entry_constructionmaterial");

// The current data row's tag, usable in a file name.
QString tagName(const QString& prefix)
{
    return prefix +
           QString::fromUtf8(QTest::currentDataTag()).replace(QRegularExpression(QStringLiteral("\\W")), "_");
}

QString vdd(const QString& diary)
{
    return VDRDocument::documentsDbPathFor(diary);
}

// "tablename|record_id|documentname|status" per documents row.
QStringList documentRows(const QString& diary)
{
    return queryTexts(vdd(diary),
                      QStringLiteral("SELECT tablename, record_id, documentname, status FROM documents "
                                     "ORDER BY id"));
}

QString materialInsert(const QString& document, int id = 1)
{
    return QStringLiteral(
               "INSERT INTO entry_constructionmaterial (id, entry_id, pos, material, quantity, unit, "
               "process, company_id, material_temperature, conditions, workflow, note, document) "
               "VALUES (%1, (SELECT MIN(id) FROM entry), 0, 'Beton', NULL, '', '', NULL, 0, '', '', '', "
               "'%2')")
        .arg(QString::number(id), document);
}

// One documents row of report 7 whose content is 'bytes' zero bytes.
QString documentInsert(int id, const QString& table, const QString& name, qint64 bytes, int recordId,
                       int status = 0, int origRecordId = -1, int origEntryId = -1)
{
    return QStringLiteral(
               "INSERT INTO documents (id, entry_id, tablename, documentname, document_content, record_id, "
               "status, orig_record_id, orig_entry_id) VALUES (%1, 7, '%2', '%3', zeroblob(%4), %5, %6, "
               "%7, %8)")
        .arg(QString::number(id), table, name, QString::number(bytes), QString::number(recordId),
             QString::number(status), QString::number(origRecordId), QString::number(origEntryId));
}

// A file of 'bytes' bytes; large ones are sparse and cost no disk.
QString makeFile(const QString& path, qint64 bytes)
{
    QDir().mkpath(QFileInfo(path).absolutePath());
    QFile f(path);
    if (!f.open(QIODevice::WriteOnly))
        return QString();
    if (bytes < 100000)
        f.write(QByteArray(int(bytes), 'x'));
    else
        f.resize(bytes);
    return path;
}

// Runs 'work' on an own connection to the documents database, as the report editors do.
void withDocumentsDb(const QString& diary, const std::function<void(QSqlDatabase)>& work)
{
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("TESTDOCS"));
        db.setDatabaseName(vdd(diary));
        QVERIFY(db.open());
        work(db);
        db.close();
    }
    QSqlDatabase::removeDatabase(QStringLiteral("TESTDOCS"));
}
} // namespace

class TestVDRDocumentsDb : public VDRTestCase
{
    Q_OBJECT

    void initTest() override { VDRDocument::setGlobalModified(false); }

private slots:
    void statusRules_data()
    {
        QTest::addColumn<int>("status");
        QTest::addColumn<bool>("reassigned"); // record 5 / report 7 were record 4 / report 6 before
        // "status|record_id|entry_id|orig_record_id|orig_entry_id" after save, reset, marking removed.
        QTest::addColumn<QStringList>("after");

        // clang-format off
        QTest::newRow("saved") << 0 << false << QStringList{"0|5|7|-1|-1", "0|5|7|-1|-1", "2|5|7|-1|-1"};
        QTest::newRow("added") << 1 << false << QStringList{"0|5|7|-1|-1", "", "3|5|7|-1|-1"};
        QTest::newRow("removed") << 2 << false << QStringList{"", "0|5|7|-1|-1", "2|5|7|-1|-1"};
        QTest::newRow("added and removed") << 3 << false << QStringList{"", "", "3|5|7|-1|-1"};
        QTest::newRow("saved, reassigned") << 0 << true << QStringList{"0|5|7|-1|-1", "0|4|6|-1|-1", "2|5|7|4|6"};
        QTest::newRow("removed, reassigned") << 2 << true << QStringList{"", "0|4|6|-1|-1", "2|5|7|4|6"};
        // clang-format on
    }

    void statusRules()
    {
        QFETCH(int, status);
        QFETCH(bool, reassigned);
        QFETCH(QStringList, after);
        const QString row = QStringLiteral(
            "SELECT status, record_id, entry_id, orig_record_id, orig_entry_id FROM documents");

        for (int operation = 0; operation < 3; ++operation) {
            const QString diary =
                m_dir.filePath(tagName("status_") + QStringLiteral("_%1.vd2").arg(operation));
            QVERIFY(VDRDocumentsDb::createDocumentsDb(diary));
            QVERIFY(execSql(vdd(diary), {documentInsert(1, kMaterial, "plan.pdf", 1, 5, status,
                                                        reassigned ? 4 : -1, reassigned ? 6 : -1)}));
            if (operation == 0)
                QVERIFY(VDRDocumentsDb::storeChangesOnDocumentsDb(diary));
            else if (operation == 1)
                QVERIFY(VDRDocumentsDb::resetChangesOnDocumentsDb(diary));
            else
                withDocumentsDb(diary, [](QSqlDatabase db) {
                    QVERIFY(VDRDocumentsDb::setStatus4DocumentRecord(db, kMaterial, 5, 2));
                });
            QCOMPARE(queryTexts(vdd(diary), row).join(QLatin1Char(';')), after.at(operation));
        }
    }

    void pendingDocumentsFollowSaveAndDiscard_data()
    {
        QTest::addColumn<bool>("saveAfterAttaching");
        QTest::addColumn<bool>("removeReport");
        QTest::addColumn<bool>("saveAtEnd");
        QTest::addColumn<QStringList>("rowsAfterClosing");

        const QStringList kept = {kMaterial + QStringLiteral("|1|plan.pdf|0")};
        QTest::newRow("attach, discard") << false << false << false << QStringList();
        QTest::newRow("attach, save") << false << false << true << kept;
        QTest::newRow("saved, report removed, discard") << true << true << false << kept;
        QTest::newRow("saved, report removed, save") << true << true << true << QStringList();
        QTest::newRow("attached, report removed, save") << false << true << true << QStringList();
        QTest::newRow("attached, report removed, discard") << false << true << false << QStringList();
    }

    void pendingDocumentsFollowSaveAndDiscard()
    {
        QFETCH(bool, saveAfterAttaching);
        QFETCH(bool, removeReport);
        QFETCH(bool, saveAtEnd);
        QFETCH(QStringList, rowsAfterClosing);
        const QString diary = diaryWithMaterial(tagName("pending_"));
        QVERIFY(!diary.isEmpty());
        const QString plan = makeFile(m_dir.filePath(QStringLiteral("outside/plan.pdf")), 3000);

        VDRDocument doc;
        QVERIFY(openDiary(doc, diary));
        const int entryId = queryValue(diary, QStringLiteral("SELECT MIN(id) FROM entry")).toInt();
        QCOMPARE(VDRDocumentsDb::addDocument(&doc, kMaterial, 1, entryId, plan), QStringLiteral("plan.pdf"));
        QCOMPARE(documentRows(diary), QStringList{kMaterial + QStringLiteral("|1|plan.pdf|1")});

        // The user can open what was stored.
        const QString copy = VDRDocumentsDb::getDocumentTempPath(&doc, kMaterial, 1);
        QFile read(copy);
        QVERIFY(read.open(QIODevice::ReadOnly));
        QCOMPARE(read.readAll(), QByteArray(3000, 'x'));
        read.close();

        if (saveAfterAttaching)
            QCOMPARE(doc.saveDocument(), 0);
        if (removeReport)
            QVERIFY(VDRDocumentsDb::removeRecordsOnDocumentsDb4Entry(&doc, entryId));
        if (saveAtEnd)
            QCOMPARE(doc.saveDocument(), 0);
        QVERIFY(doc.closeDocument());
        QCOMPARE(documentRows(diary), rowsAfterClosing);
        QVERIFY(!QFileInfo::exists(copy));
    }

    void attachRefusals_data()
    {
        QTest::addColumn<qint64>("bytes"); // -1: no file
        QTest::addColumn<QString>("title");
        QTest::addColumn<QString>("textPart");

        // clang-format off
        QTest::newRow("60,000,000 bytes") << qint64(60000000) << "Dokument importieren"
            << "aufgrund der Dateigröße (58 MB) nicht importiert werden.\nDie maximale Dateigröße für den Import von "
               "Dokumenten beträgt 50 MB.";
        QTest::newRow("exactly the limit") << qint64(52224000) << "Dokument importieren" << "(51 MB)";
        QTest::newRow("missing file") << qint64(-1) << "Dateifehler" << "existiert nicht.";
        // clang-format on
    }

    void attachRefusals()
    {
        QFETCH(qint64, bytes);
        QFETCH(QString, title);
        QFETCH(QString, textPart);
        const QString diary = diaryWithMaterial(QStringLiteral("refused_%1").arg(bytes));
        const QString file = m_dir.filePath(QStringLiteral("refused_%1.pdf").arg(bytes));
        if (bytes >= 0)
            QVERIFY(!makeFile(file, bytes).isEmpty());

        VDRDocument doc;
        QVERIFY(openDiary(doc, diary));
        m_prompt.expect(title, textPart);
        QVERIFY(VDRDocumentsDb::addDocument(&doc, kMaterial, 1, 1, file).isEmpty());
        QVERIFY(doc.closeDocument());
        QVERIFY(!QFileInfo::exists(vdd(diary)) || documentRows(diary).isEmpty());
    }

    void importOnOpening_data()
    {
        QTest::addColumn<QString>("importState"); // empty: the meta row is missing, as in older files
        QTest::addColumn<QString>("document");
        QTest::addColumn<QString>("fileInFolder");
        QTest::addColumn<qint64>("bytes");
        QTest::addColumn<QString>("title"); // the message expected, if any
        QTest::addColumn<QString>("textPart");
        QTest::addColumn<bool>("imported");

        // clang-format off
        QTest::newRow("file present") << "pending" << "plan.pdf" << "plan.pdf" << qint64(5000) << "" << "" << true;
        QTest::newRow("no meta row, name padded") << "" << "  plan.pdf " << "plan.pdf" << qint64(5000) << "" << "" << true;
        QTest::newRow("missing file") << "pending" << "fehlt.pdf" << "" << qint64(0) << "Dateifehler"
                                      << "da sie nicht existieren:\n\nfehlt.pdf" << false;
        QTest::newRow("name leaving the folder") << "pending" << "../geheim.txt" << "" << qint64(0) << "Dateifehler"
                                                 << "../geheim.txt" << false;
        QTest::newRow("60,000,000 bytes") << "pending" << "gross.pdf" << "gross.pdf" << qint64(60000000)
                                          << "Dokument importieren" << "gross.pdf kann aufgrund der Dateigröße (58 MB)"
                                          << false;
        QTest::newRow("already done") << "done" << "plan.pdf" << "plan.pdf" << qint64(5000) << "" << "" << false;
        // clang-format on
    }

    void importOnOpening()
    {
        QFETCH(QString, importState);
        QFETCH(QString, document);
        QFETCH(QString, fileInFolder);
        QFETCH(qint64, bytes);
        QFETCH(QString, title);
        QFETCH(QString, textPart);
        QFETCH(bool, imported);
        const QString name = tagName("import_");
        const QString diary = diaryWithMaterial(name, document);
        QVERIFY(!diary.isEmpty());
        QVERIFY(execSql(diary, {importState.isEmpty()
                                    ? QStringLiteral("DELETE FROM meta WHERE key = 'documentImport'")
                                    : QStringLiteral("UPDATE meta SET value = '%1' WHERE key = "
                                                     "'documentImport'")
                                          .arg(importState)}));
        if (!fileInFolder.isEmpty())
            QVERIFY(
                !makeFile(m_dir.filePath(name + QStringLiteral("_files/") + fileInFolder), bytes).isEmpty());
        QDir().mkpath(m_dir.filePath(name + QStringLiteral("_files")));
        makeFile(m_dir.filePath(QStringLiteral("geheim.txt")), 10); // beside the diary, outside the folder

        if (!title.isEmpty())
            m_prompt.expect(title, textPart);
        VDRDocument doc;
        QVERIFY(openDiary(doc, diary));
        QCOMPARE(doc.metaValue(QStringLiteral("documentImport")), QStringLiteral("done"));
        QSqlQuery q(doc.database());
        QVERIFY(q.exec(QStringLiteral("SELECT document FROM entry_constructionmaterial WHERE id = 1")) &&
                q.next());
        QCOMPARE(q.value(0).toString(), imported ? QStringLiteral("plan.pdf") : document);
        q.finish();
        QCOMPARE(QFileInfo::exists(vdd(diary)) ? documentRows(diary) : QStringList(),
                 imported ? QStringList{kMaterial + "|1|plan.pdf|1"} : QStringList());
        // Something was imported: closing must ask before throwing it away.
        QCOMPARE(doc.isStateModified(), imported);
        QVERIFY(doc.closeDocument());
    }

    void deadRecordsAndCompaction()
    {
        const QString diary = diaryWithMaterial(QStringLiteral("dead"));
        QVERIFY(VDRDocumentsDb::createDocumentsDb(diary));
        QVERIFY(execSql(vdd(diary), {documentInsert(1, kMaterial, "live.pdf", 1000, 1),
                                     documentInsert(2, kMaterial, "dead.pdf", 3000000, 99),
                                     documentInsert(3, "entry_scheduleddelivery", "delivery.pdf", 1000, 1)}));

        // While the diary is open a discard must still get the saved documents back.
        {
            VDRDocument doc;
            QVERIFY(openDiary(doc, diary));
            withDocumentsDb(diary, [&doc](QSqlDatabase db) {
                QCOMPARE(VDRDocumentsDb::removeDeadRecordsInDocumentDB(db, doc.database()), 2);
            });
            QCOMPARE(documentRows(diary),
                     QStringList({kMaterial + "|1|live.pdf|0", kMaterial + "|99|dead.pdf|2",
                                  "entry_scheduleddelivery|1|delivery.pdf|2"}));
            QVERIFY(doc.closeDocument());
        }
        QCOMPARE(documentRows(diary).size(), 3);

        // The diary's compaction judges by the working copy: a document of an unsaved row survives it.
        {
            VDRDocument doc;
            QVERIFY(openDiary(doc, diary));
            QVERIFY(QSqlQuery(doc.database()).exec(materialInsert("neu.pdf", 2)));
            const QString file = makeFile(m_dir.filePath(QStringLiteral("neu.pdf")), 100);
            QCOMPARE(VDRDocumentsDb::addDocument(&doc, kMaterial, 2, 1, file), QStringLiteral("neu.pdf"));
            m_prompt.expect("Datenbank bereinigen", "wird jetzt bereinigt");
            QCOMPARE(doc.compactDB(false), 0);
            QVERIFY(doc.closeDocument());
        }
        QCOMPARE(documentRows(diary).last(), kMaterial + "|2|neu.pdf|0");

        const qint64 before = QFileInfo(vdd(diary)).size();
        m_prompt.expect("Dokumente-Datenbank komprimieren", "wird jetzt komprimiert");
        m_prompt.expect("Dokumente-Datenbank komprimieren",
                        "erfolgreich komprimiert.\nDie Dateigröße wurde von");
        QVERIFY(VDRDocumentsDb::compactDocumentDB(diary, true));
        QCOMPARE(documentRows(diary), QStringList({kMaterial + "|1|live.pdf|0", kMaterial + "|2|neu.pdf|0"}));
        QVERIFY(QFileInfo(vdd(diary)).size() < before / 10);

        // Without messages (the diary's compaction shows its own) a diary without documents is no error.
        QVERIFY(VDRDocumentsDb::compactDocumentDB(m_dir.filePath(QStringLiteral("none.vd2"))));
    }

    void freeSpaceOffer_data()
    {
        QTest::addColumn<int>("keptMB");
        QTest::addColumn<int>("freedMB");
        QTest::addColumn<int>("answer"); // -2: no offer expected

        QTest::newRow("nothing to free") << 0 << 0 << -2;
        QTest::newRow("8 MB free") << 0 << 8 << -2;
        QTest::newRow("11 MB free, compacted") << 0 << 11 << 0;
        QTest::newRow("11 MB free, declined") << 0 << 11 << 1;
        QTest::newRow("11 MB free but under a quarter") << 34 << 11 << -2;
    }

    void freeSpaceOffer()
    {
        QFETCH(int, keptMB);
        QFETCH(int, freedMB);
        QFETCH(int, answer);
        const QString diary =
            diaryWithMaterial(QStringLiteral("space%1_%2_%3").arg(keptMB).arg(freedMB).arg(answer));
        QVERIFY(VDRDocumentsDb::createDocumentsDb(diary));
        QVERIFY(execSql(vdd(diary), {documentInsert(1, kMaterial, "plan.pdf", keptMB * 1024000, 1),
                                     documentInsert(2, kMaterial, "plan.pdf", freedMB * 1024000, 1),
                                     QStringLiteral("DELETE FROM documents WHERE id = 2")}));
        const qint64 before = QFileInfo(vdd(diary)).size();

        if (answer != -2)
            m_prompt.expect("Dokumente-Datenbank bereinigen",
                            QStringLiteral("Dadurch werden ca. %1 MB freigegeben.").arg(freedMB), answer);
        if (answer == 0) {
            m_prompt.expect("Dokumente-Datenbank komprimieren", "wird jetzt komprimiert");
            m_prompt.expect("Dokumente-Datenbank komprimieren", "erfolgreich komprimiert");
        }
        VDRDocumentsDb::checkDocumentDBsFreeSpace(diary);
        if (answer == 0)
            QVERIFY(QFileInfo(vdd(diary)).size() < before - freedMB * 1000000);
        else
            QCOMPARE(QFileInfo(vdd(diary)).size(), before);
        QCOMPARE(documentRows(diary), QStringList{kMaterial + "|1|plan.pdf|0"});
    }

private:
    // A saved diary with one construction material row (id 1) naming 'document'.
    QString diaryWithMaterial(const QString& name, const QString& document = QString())
    {
        const QString path = m_dir.filePath(name + QStringLiteral(".vd2"));
        if (!createDiary(path) || !execSql(path, {materialInsert(document)}))
            return QString();
        return path;
    }
};

QTEST_GUILESS_MAIN(TestVDRDocumentsDb)
#include "tst_vdrdocumentsdb.moc"
