#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDiaryCheck.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"
#include "document/VDRFileSizeDialog.h"

#include <QDir>
#include <QSettings>
#include <QSqlDatabase>
#include <QSqlQuery>
#include <QtTest>

#include <cerrno>

using namespace VDRTestFixtures;

namespace {
// The names beside the diary, backups and leftovers included.
QStringList filesBeside(const QString& path)
{
    // A dropped backup is removed in the background; the listing shows the state after it.
    VDRFileOps::waitForBackgroundRemovals();
    QStringList names = QFileInfo(path).absoluteDir().entryList(QDir::Files);
    names.sort();
    return names;
}

// "name: project" of the diary and each backup beside it; a damaged one says so.
QStringList diaryAndBackups(const QString& path)
{
    QStringList state;
    for (const QString& name : filesBeside(path)) {
        const QString file = QFileInfo(path).dir().filePath(name);
        if (name.endsWith(QLatin1String(".vd2")) || name.endsWith(QLatin1String(".bak")))
            state << name + QStringLiteral(": ") + projectNameIn(file) +
                         (isIntact(file) ? QString() : QStringLiteral(" (beschädigt)"));
    }
    return state;
}
} // namespace

class TestVDRDocumentSave : public VDRTestCase
{
    Q_OBJECT

    void initTest() override
    {
        VDRFileOps::setFailurePredicate(nullptr);
        QSettings().setValue(VDRDocument::numberOfBackupsSettingsKey(), 4);
    }
    void cleanupTest() override { VDRFileOps::setFailurePredicate(nullptr); }

private slots:
    void backupsRotateOncePerOpening_data()
    {
        QTest::addColumn<int>("backups");
        QTest::addColumn<int>("openings");
        QTest::addColumn<int>("savesPerOpening");
        QTest::addColumn<QStringList>("expected"); // file: project name

        QTest::newRow("four kept, five openings")
            << 4 << 5 << 1
            << QStringList{"d.vd2: Stand 5.1", "d.vd2.01.bak: Stand 3.1", "d.vd2.02.bak: Stand 2.1",
                           "d.vd2.03.bak: Stand 1.1", "d.vd2.bak: Stand 4.1"};
        QTest::newRow("three openings") << 4 << 3 << 1
                                        << QStringList{"d.vd2: Stand 3.1", "d.vd2.01.bak: Stand 1.1",
                                                       "d.vd2.02.bak: Neues Varduna", "d.vd2.bak: Stand 2.1"};
        QTest::newRow("five saves in one opening")
            << 4 << 1 << 5 << QStringList{"d.vd2: Stand 1.5", "d.vd2.bak: Stand 1.4"};
        QTest::newRow("none kept") << 0 << 3 << 2 << QStringList{"d.vd2: Stand 3.2"};
        QTest::newRow("twelve kept: the long name form")
            << 12 << 12 << 1 << QStringList{"d.vd2: Stand 12.1",       "d.vd2.01.bak: Stand 10.1",
                                            "d.vd2.02.bak: Stand 9.1", "d.vd2.03.bak: Stand 8.1",
                                            "d.vd2.04.bak: Stand 7.1", "d.vd2.05.bak: Stand 6.1",
                                            "d.vd2.06.bak: Stand 5.1", "d.vd2.07.bak: Stand 4.1",
                                            "d.vd2.08.bak: Stand 3.1", "d.vd2.09.bak: Stand 2.1",
                                            "d.vd2.10.bak: Stand 1.1", "d.vd2.11.bak: Neues Varduna",
                                            "d.vd2.bak: Stand 11.1"};
    }

    void backupsRotateOncePerOpening()
    {
        QFETCH(int, backups);
        QFETCH(int, openings);
        QFETCH(int, savesPerOpening);
        QFETCH(QStringList, expected);
        QSettings().setValue(VDRDocument::numberOfBackupsSettingsKey(), backups);
        const QString path = diary(QStringLiteral("d.vd2"));
        for (int o = 1; o <= openings; ++o) {
            VDRDocument doc;
            QVERIFY(openDiary(doc, path));
            for (int s = 1; s <= savesPerOpening; ++s) {
                QVERIFY(setProjectName(doc, QStringLiteral("Stand %1.%2").arg(o).arg(s)));
                QCOMPARE(doc.saveDocument(), 0);
                QVERIFY(doc.isStateValid());
                QVERIFY(doc.isStateSaved());
            }
            QVERIFY(doc.closeDocument());
        }
        QCOMPARE(diaryAndBackups(path), expected);
        QCOMPARE(filesBeside(path).size(), expected.size());
    }

    void failedSaveLeavesEverythingComplete_data()
    {
        QTest::addColumn<int>("failAt");
        QTest::addColumn<bool>("firstSave");
        // A first save touches: the copy, putting the oldest backup aside, three renames, the link,
        // the final rename, each rename and link followed by flushing the folder. Failing each in turn,
        // and a few past the end (nothing fails then).
        for (int n = 1; n <= 15; ++n) {
            QTest::newRow(qPrintable(QStringLiteral("first save, operation %1").arg(n))) << n << true;
            QTest::newRow(qPrintable(QStringLiteral("later save, operation %1").arg(n))) << n << false;
        }
    }

    void failedSaveLeavesEverythingComplete()
    {
        QFETCH(int, failAt);
        QFETCH(bool, firstSave);
        // Four generations of backups to rotate, each with its own state.
        const QString path = diaryWithGenerations(
            QStringLiteral("d.vd2"), {"Generation 1", "Generation 2", "Generation 3", "Generation 4"});
        QVERIFY(!path.isEmpty());
        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        if (!firstSave) {
            QVERIFY(setProjectName(doc, QStringLiteral("Zwischenstand")));
            QCOMPARE(doc.saveDocument(), 0);
        }
        const QStringList before = diaryAndBackups(path);

        QVERIFY(setProjectName(doc, QStringLiteral("Neuer Stand")));
        int count = 0;
        const QString folder = QFileInfo(path).absolutePath();
        bool finalRenameDone = false;
        bool finalFlushFailed = false;
        VDRFileOps::setFailurePredicate([&](VDRFileOps::Op op, const QString& p) {
            if (op == VDRFileOps::CheckWritable || !p.startsWith(folder))
                return false;
            const bool fail = ++count == failAt;
            finalFlushFailed |= fail && finalRenameDone && op == VDRFileOps::SyncFolder;
            finalRenameDone |= op == VDRFileOps::Rename && p == QFileInfo(path).absoluteFilePath();
            return fail;
        });
        const int result = doc.saveDocument();
        VDRFileOps::setFailurePredicate(nullptr);
        // Some operations have a fallback (no hard link: rename); then the save goes through.
        const bool failed = result != 0;
        if (failAt == 1)
            QVERIFY(failed); // the copy itself has no fallback
        if (failed) {
            QCOMPARE(result, 2);
            QCOMPARE(m_prompt.messages.size(), 1);
            QCOMPARE(m_prompt.messages.first().title, QStringLiteral("Dateifehler"));
            m_prompt.reset();
        } else {
            QCOMPARE(result, 0);
        }

        // The diary is complete and holds the old or the new state (the new one when only flushing the
        // folder after the final rename failed); backups are intact; nothing else lies around.
        QVERIFY(isIntact(path));
        QCOMPARE(projectNameIn(path),
                 failed && !finalFlushFailed
                     ? (firstSave ? QStringLiteral("Generation 4") : QStringLiteral("Zwischenstand"))
                     : QStringLiteral("Neuer Stand"));
        const QRegularExpression allowed(QStringLiteral("\\.(vd2|bak|udf|workingcopy|workingcopy-journal)$"));
        for (const QString& name : filesBeside(path))
            QVERIFY2(allowed.match(name).hasMatch(), qPrintable(name));
        // The open document holds its working copy exclusively; it is checked by using it below.
        const QStringList after = diaryAndBackups(path);
        QVERIFY2(!after.join(QLatin1Char('\n')).contains(QStringLiteral("(beschädigt)")),
                 qPrintable(after.join(QLatin1Char('\n'))));
        if (failed && !finalFlushFailed)
            QCOMPARE(after, before);

        // The working copy stays open for further editing, and the next save goes through.
        QVERIFY(doc.isStateValid());
        QVERIFY(setProjectName(doc, QStringLiteral("Nach dem Fehler")));
        QCOMPARE(doc.saveDocument(), 0);
        QCOMPARE(projectNameIn(path), QStringLiteral("Nach dem Fehler"));
        QVERIFY(doc.closeDocument());
    }

    void leftoverOfInterruptedSaveIsRemovedOnOpening()
    {
        const QString path = diary(QStringLiteral("d.vd2"));
        const QString leftover = VDRFileOps::writeDurableCopy(path, path);
        QVERIFY(!leftover.isEmpty());
        QVERIFY(QFile::copy(path, path + QStringLiteral(".02.bak.drop")));
        const QString unrelated = QFileInfo(path).dir().filePath(QStringLiteral("d.vd2.notes.tmp"));
        QVERIFY(QFile::copy(path, unrelated));

        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        QVERIFY(!QFile::exists(leftover));
        QVERIFY(QFile::exists(path + QStringLiteral(".02.bak")));
        QVERIFY(QFile::exists(unrelated));
        QVERIFY(doc.closeDocument());
    }

    void saveAsMovesWorkingCopyAndLock()
    {
        const QString path = diary(QStringLiteral("alt.vd2"));
        const QString target = QFileInfo(path).absolutePath() + QStringLiteral("/Kopie März.vd2");
        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        QVERIFY(setProjectName(doc, QStringLiteral("Unter neuem Namen")));
        QCOMPARE(doc.saveDocument(target), 0);
        QCOMPARE(doc.getFilepath(), target);
        QCOMPARE(doc.getFilepathWorkingCopy(), target + QStringLiteral(".workingcopy"));
        QVERIFY(QFile::exists(target + QStringLiteral(".workingcopy")));
        QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
        QVERIFY(!QFile::exists(VDRDocument::lockInfoPathFor(path)));
        QCOMPARE(VDRDocument::readLockInfo(VDRDocument::lockInfoPathFor(target)).value(0),
                 VDRDocument::currentUserName());
        QCOMPARE(projectNameIn(path), QStringLiteral("Neues Varduna"));
        QCOMPARE(projectNameIn(target), QStringLiteral("Unter neuem Namen"));

        // Edits go on in the new file.
        QVERIFY(setProjectName(doc, QStringLiteral("Weiter")));
        QCOMPARE(doc.saveDocument(), 0);
        QCOMPARE(projectNameIn(target), QStringLiteral("Weiter"));
        QCOMPARE(projectNameIn(target + QStringLiteral(".bak")), QStringLiteral("Unter neuem Namen"));
        QVERIFY(doc.closeDocument());
        QCOMPARE(filesBeside(path), QStringList({"Kopie März.vd2", "Kopie März.vd2.bak", "alt.vd2"}));

        // Saving a diary without documents over one with documents leaves no foreign documents behind.
        const QString other = QFileInfo(path).absolutePath() + QStringLiteral("/Anderes.vdd");
        QVERIFY(QFile::copy(path, other)); // any file stands in for the other diary's documents
        QVERIFY(openDiary(doc, path));
        QCOMPARE(doc.saveDocument(QFileInfo(path).absolutePath() + QStringLiteral("/Anderes.vd2")), 0);
        QVERIFY(!QFile::exists(other));
        QVERIFY(doc.closeDocument());
    }

    void newDiarySavedUnderAName()
    {
        const QString folder = m_dir.filePath(QStringLiteral("neu"));
        QDir().mkpath(folder);
        const QString target = folder + QStringLiteral("/Baustelle.vd2");
        VDRDocument doc;
        QVERIFY(doc.createDocument(true));
        const QString temporaryCopy = doc.getFilepathWorkingCopy();
        QVERIFY(setProjectName(doc, QStringLiteral("Neubau")));
        QCOMPARE(doc.saveDocument(), 2); // no file name yet
        QCOMPARE(m_prompt.messages.value(0).text, QStringLiteral("Dateiname fehlt."));
        m_prompt.reset();
        QVERIFY(doc.isStateValid());
        QCOMPARE(doc.saveDocument(target), 0);
        QVERIFY(!doc.isStateNew());
        QVERIFY(!QFile::exists(temporaryCopy));
        QCOMPARE(projectNameIn(target), QStringLiteral("Neubau"));
        QVERIFY(doc.closeDocument());
        QCOMPARE(filesBeside(target), QStringList{"Baustelle.vd2"});
    }

    void saveAsNeverOverwritesADiaryInUse()
    {
        const QString path = diary(QStringLiteral("d.vd2"));
        const QString target = QFileInfo(path).absolutePath() + QStringLiteral("/belegt.vd2");
        QVERIFY(createDiary(target));
        QVERIFY(execSql(target, {"UPDATE vdr SET name = 'Kollegin arbeitet'"}));
        const QByteArray before = fileHash(target);
        // Another instance holds the target: its working copy is locked exclusively.
        QVERIFY(QFile::copy(target, target + QStringLiteral(".workingcopy")));
        {
            QSqlDatabase holder =
                QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("HOLDER"));
            holder.setDatabaseName(target + QStringLiteral(".workingcopy"));
            QVERIFY(holder.open());
            QSqlQuery q(holder);
            QVERIFY(q.exec("PRAGMA locking_mode = EXCLUSIVE"));
            QVERIFY(q.exec("INSERT INTO meta (key, value) VALUES ('dummy', 'dummy')"));
            QVERIFY(q.exec("DELETE FROM meta WHERE key = 'dummy'"));

            VDRDocument doc;
            QVERIFY(openDiary(doc, path));
            m_prompt.expect(QStringLiteral("Datenbank in Bearbeitung"),
                            QStringLiteral("kann nicht überschrieben werden"));
            QCOMPARE(doc.saveDocument(target), 2);
            QVERIFY(doc.isStateValid());
            QCOMPARE(doc.getFilepath(), QFileInfo(path).absoluteFilePath());
            QVERIFY(doc.closeDocument());
            q.finish();
            holder.close();
        }
        QSqlDatabase::removeDatabase(QStringLiteral("HOLDER"));
        QCOMPARE(fileHash(target), before);
    }

    void olderStructureAsksAndWritesCurrentVersion_data()
    {
        QTest::addColumn<int>("answer");
        QTest::newRow("continue") << int(VDRPrompt::Ok);
        QTest::newRow("cancel") << int(VDRPrompt::Cancel);
    }

    void olderStructureAsksAndWritesCurrentVersion()
    {
        QFETCH(int, answer);
        const QString path = diary(QStringLiteral("d.vd2"));
        QVERIFY(createOldestLayoutDiary(path, QStringLiteral("0.3")));
        VDRDocument doc;
        m_prompt.expect(QStringLiteral("Datei-Warnung"),
                        QStringLiteral("Die Struktur des Dokuments wird jetzt erweitert"));
        QVERIFY(openDiary(doc, path));
        m_prompt.expect(QStringLiteral("Datei-Warnung"), QStringLiteral("Vorgang fortsetzen?"), answer);
        const int result = doc.saveDocument();
        QCOMPARE(result, answer == VDRPrompt::Ok ? 0 : 1);
        QCOMPARE(queryValue(path, "SELECT value FROM meta WHERE key = 'fileversion'").toString(),
                 answer == VDRPrompt::Ok ? QStringLiteral("0.4") : QStringLiteral("0.3"));
        QCOMPARE(
            queryValue(path, "SELECT count(*) FROM sqlite_master WHERE name = 'entry_equipment'").toInt(),
            answer == VDRPrompt::Ok ? 1 : 0);
        if (answer == VDRPrompt::Ok)
            QCOMPARE(doc.saveDocument(), 0); // asked once
        QVERIFY(doc.closeDocument());
    }

    // Refused where the program asks for write access (root may write anything); the demo project's
    // refusal is tested with the demo itself.
    void readOnlyDiaryRefusesSave()
    {
        const QString path = diary(QStringLiteral("d.vd2"));
        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        const QString absolute = QFileInfo(path).absoluteFilePath();
        VDRFileOps::setFailurePredicate([absolute](VDRFileOps::Op op, const QString& p) {
            return op == VDRFileOps::CheckWritable && p == absolute;
        });
        QVERIFY(setProjectName(doc, QStringLiteral("Geändert")));
        m_prompt.expect(QStringLiteral("Speicher-Fehler"),
                        QStringLiteral("da sie keine Schreibrechte besitzen"));
        QCOMPARE(doc.saveDocument(), 1);
        QVERIFY(doc.isStateValid());
        QCOMPARE(projectNameIn(path), QStringLiteral("Neues Varduna"));
        QVERIFY(doc.closeDocument());
    }

    void damagedDiaryIsRestoredFromNewestIntactBackup_data()
    {
        QTest::addColumn<QStringList>("damaged"); // which of diary, bak, 01, 02 are damaged
        QTest::addColumn<QString>("text");
        QTest::addColumn<QString>("restoredFrom");
        const QString newest = "Das neueste unbeschädigte Backup stammt vom";
        // clang-format off
        QTest::newRow("newest backup intact") << QStringList{"d.vd2"} << newest << "Stand 3";
        QTest::newRow("newest backup damaged too") << QStringList{"d.vd2", "d.vd2.bak"} << newest << "Stand 2";
        QTest::newRow("all backups damaged") << QStringList{"d.vd2", "d.vd2.bak", "d.vd2.01.bak", "d.vd2.02.bak", "d.vd2.03.bak"}
            << "Die Backup-Dateien sind ebenfalls beschädigt. Wenn sie über Sicherungskopien" << QString();
        // clang-format on
    }

    void damagedDiaryIsRestoredFromNewestIntactBackup()
    {
        QFETCH(QStringList, damaged);
        QFETCH(QString, text);
        QFETCH(QString, restoredFrom);
        const QString path =
            diaryWithGenerations(QStringLiteral("d.vd2"), {"Stand 1", "Stand 2", "Stand 3", "Stand 4"});
        QVERIFY(!path.isEmpty());
        // Now: d.vd2 = Stand 4, .bak = Stand 3, .01 = Stand 2, .02 = Stand 1, .03 = the new diary.
        for (const QString& name : damaged)
            QVERIFY(damageFile(QFileInfo(path).dir().filePath(name)));

        VDRDocument doc;
        bool showError = true;
        m_prompt.expect(QStringLiteral("Beschädigte Datenbank-Datei"), text, 0);
        if (restoredFrom.isEmpty()) {
            QVERIFY(!doc.openDocument(path, showError)); // "Abbrechen"
            QVERIFY(!showError);
            return;
        }
        m_prompt.expect(
            QStringLiteral("Backup wiederherstellen"),
            QStringLiteral("Die Datei wurde erfolgreich wiederhergestellt und wird jetzt geöffnet.\nDie "
                           "beschädigte Datei wurde umbenannt in %1.")
                .arg(QDir::toNativeSeparators(QFileInfo(path).absolutePath() + "/dERROR.01.vd2")));
        QVERIFY(doc.openDocument(path, showError));
        QCOMPARE(doc.projectName(), restoredFrom);
        QVERIFY(doc.closeDocument());
        QVERIFY(!isIntact(QFileInfo(path).dir().filePath(QStringLiteral("dERROR.01.vd2"))));
    }

    void compactionRemovesUnreferencedImages()
    {
        const QString path = diary(QStringLiteral("d.vd2"));
        QStringList statements;
        for (int i = 1; i <= 6; ++i)
            statements << imageInsertSql(400000);
        statements << "UPDATE vdr SET logo_image_id = 1"
                   << "INSERT INTO entry_photo (id, entry_id, pos, type, photo_image_id, caption, comment, "
                      "date, relation_id) VALUES (1, 1, 0, 1, 4, 'Foto', '', '2026-12-01', -1)";
        QVERIFY(execSql(path, statements));
        const qint64 before = QFileInfo(path).size();

        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        m_prompt.expect(QStringLiteral("Datenbank bereinigen"),
                        QStringLiteral("Die Datenbank wird jetzt bereinigt."));
        m_prompt.expect(
            QStringLiteral("Datenbank bereinigen"),
            QStringLiteral("Die Datenbank wurde erfolgreich bereinigt.\nDie Dateigröße wurde von %1 auf ")
                .arg(VDRDocument::formatFileSize(before)));
        QCOMPARE(doc.compactDB(true), 0);
        QVERIFY(doc.isStateValid());
        QCOMPARE(doc.modelVdr()->rowCount(), 1);
        QVERIFY(doc.closeDocument());

        QCOMPARE(queryTexts(path, "SELECT id FROM image ORDER BY id"), QStringList({"1", "4"}));
        QCOMPARE(queryValue(path, "SELECT value FROM meta WHERE key = 'imageDeletion'").toString(),
                 QStringLiteral("done"));
        QVERIFY(QFileInfo(path).size() < before - 4 * 400000);
        QVERIFY(isIntact(path));

        // A second compaction finds the marker already there.
        QVERIFY(openDiary(doc, path));
        m_prompt.expect(QStringLiteral("Datenbank bereinigen"), QStringLiteral("wird jetzt bereinigt"));
        m_prompt.expect(QStringLiteral("Datenbank bereinigen"),
                        QStringLiteral("Die Datenbank wurde erfolgreich bereinigt.\n"));
        QCOMPARE(doc.compactDB(true), 0);
        QVERIFY(doc.closeDocument());
    }

    void compactionAfterACancelledSaveKeepsTheFileMode()
    {
        const QString path = diary(QStringLiteral("d.vd2"));
        QVERIFY(createOldestLayoutDiary(path, QStringLiteral("0.3")));
        QVERIFY(QFile::setPermissions(path, QFile::ReadOwner | QFile::WriteOwner | QFile::ReadGroup));
        const QFile::Permissions mode = QFile::permissions(path);
        VDRDocument doc;
        m_prompt.expect(QStringLiteral("Datei-Warnung"), QStringLiteral("wird jetzt erweitert"));
        QVERIFY(openDiary(doc, path));

        // Cancelling the save's question is no failure; the next compaction goes through.
        m_prompt.expect(QStringLiteral("Datenbank bereinigen"), QStringLiteral("wird jetzt bereinigt"));
        m_prompt.expect(QStringLiteral("Datei-Warnung"), QStringLiteral("Vorgang fortsetzen?"),
                        VDRPrompt::Cancel);
        QCOMPARE(doc.compactDB(true), 1);
        m_prompt.expect(QStringLiteral("Datenbank bereinigen"), QStringLiteral("wird jetzt bereinigt"));
        m_prompt.expect(QStringLiteral("Datei-Warnung"), QStringLiteral("Vorgang fortsetzen?"),
                        VDRPrompt::Ok);
        m_prompt.expect(QStringLiteral("Datenbank bereinigen"), QStringLiteral("erfolgreich bereinigt"));
        QCOMPARE(doc.compactDB(true), 0);
        QCOMPARE(QFile::permissions(path), mode);
        QVERIFY(VDRDiaryCheck::isHeld(doc.getFilepathWorkingCopy())); // the lock is taken again
        QVERIFY(doc.closeDocument());
        QVERIFY(isIntact(path));
    }

    void fullDiskGivesOneMessageWithItsReason()
    {
        const QString folder = m_dir.filePath(QStringLiteral("voll"));
        SmallDisk disk(folder, 1024 * 1024);
        const QString path = QDir(folder).filePath(QStringLiteral("d.vd2"));
        QVERIFY(createDiary(path));
        const QByteArray before = fileHash(path);
        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        QVERIFY(setProjectName(doc, QStringLiteral("Ungespeichert")));
        // A real full disk where the test may mount one, else the same error injected.
        if (disk.isMounted()) {
            QVERIFY(disk.fill());
        } else {
            VDRFileOps::setFailurePredicate(
                [](VDRFileOps::Op op, const QString&) { return op == VDRFileOps::Copy; });
            VDRFileOps::setFailureErrno(ENOSPC);
        }
        m_prompt.expect(
            QStringLiteral("Dateifehler"),
            QStringLiteral("Kopieren der Datei\n%1\n fehlgeschlagen.\nAuf dem Gerät ist kein Speicherplatz "
                           "mehr verfügbar.")
                .arg(QDir::toNativeSeparators(path)));
        const int shown = VDRPrompt::messagesShown();
        QCOMPARE(doc.saveDocument(), 2);
        QCOMPARE(VDRPrompt::messagesShown(), shown + 1);
        VDRFileOps::setFailurePredicate(nullptr);
        // Nothing is lost: the diary is as it was, the edit stays open in the working copy.
        QCOMPARE(fileHash(path), before);
        QVERIFY(doc.isStateValid());
        QCOMPARE(doc.projectName(), QStringLiteral("Ungespeichert"));
        QVERIFY(doc.closeDocument());
    }

    void manyDeletedImagesOfferCompaction()
    {
        const QString path = diary(QStringLiteral("d.vd2"));
        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        for (int i = 0; i < 4; ++i)
            doc.decrementCompactDbImageCnt();
        QCOMPARE(doc.saveDocument(), 0); // four are not many
        doc.decrementCompactDbImageCnt();
        m_prompt.expect(QStringLiteral("Speichern"),
                        QStringLiteral("Es wurden mehrere Bilder gelöscht.\n\nDas Löschen"), 0);
        QCOMPARE(doc.saveDocument(), 0);
        QCOMPARE(doc.saveDocument(), 0); // compacted: counted anew
        QVERIFY(doc.closeDocument());
    }

    void fileSizeCheckAfterOpening_data()
    {
        QTest::addColumn<int>("limit");
        QTest::addColumn<QString>("meta");
        QTest::addColumn<int>("answer");
        QTest::addColumn<bool>("notAgain");
        QTest::addColumn<int>("result");
        // clang-format off
        QTest::newRow("below the limit") << 2 << QString() << -1 << false << int(VDRFileSizeDialog::NotDue);
        QTest::newRow("over the limit, export") << 0 << QString() << 0 << false << int(VDRFileSizeDialog::ExportRequested);
        QTest::newRow("over the limit, cancel") << 0 << QString() << 1 << false << int(VDRFileSizeDialog::Dismissed);
        QTest::newRow("not again for this file") << 0 << QString() << 1 << true << int(VDRFileSizeDialog::Dismissed);
        QTest::newRow("warning switched off") << 0 << "NoFileSizeWarning" << -1 << false << int(VDRFileSizeDialog::NotDue);
        QTest::newRow("master data exported") << 0 << "exportedTo" << -1 << false << int(VDRFileSizeDialog::NotDue);
        // clang-format on
    }

    void fileSizeCheckAfterOpening()
    {
        QFETCH(int, limit);
        QFETCH(QString, meta);
        QFETCH(int, answer);
        QFETCH(bool, notAgain);
        QFETCH(int, result);
        const QString path = diary(QStringLiteral("gross.vd2"));
        // A little over one MB (bytes / 1,024,000).
        QStringList statements{imageInsertSql(1100000)};
        if (!meta.isEmpty())
            statements << QStringLiteral("INSERT INTO meta (key, value) VALUES ('%1', '1')").arg(meta);
        QVERIFY(execSql(path, statements));
        QSettings().setValue(VDRFileSizeDialog::fileSizeSettingsKey(), limit);

        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        if (notAgain)
            m_prompt.expectTicked(QStringLiteral("Datei-Information"), QStringLiteral("Größe von 1 MB"),
                                  answer);
        else if (answer >= 0)
            m_prompt.expect(QStringLiteral("Datei-Information"),
                            QStringLiteral("Diese Datei hat eine Größe von 1 MB.\n"), answer);
        VDRFileSizeDialog dialog(&doc);
        QCOMPARE(int(dialog.exec()), result);
        QVERIFY(doc.closeDocument());
        QCOMPARE(queryValue(path, "SELECT value FROM meta WHERE key = 'NoFileSizeWarning'").toString(),
                 notAgain || meta == QLatin1String("NoFileSizeWarning") ? QStringLiteral("1") : QString());
        QSettings().remove(VDRFileSizeDialog::fileSizeSettingsKey());
    }

private:
    // A new, empty folder of the running test function and data row.
    QString rowFolder()
    {
        const QString folder =
            m_dir.filePath(QString::fromLatin1(QTest::currentTestFunction()) + QLatin1Char('-') +
                           QString::fromLatin1(QTest::currentDataTag()).replace(QLatin1Char(' '), '_'));
        QDir(folder).removeRecursively();
        QDir().mkpath(folder);
        return folder;
    }

    QString diary(const QString& name)
    {
        const QString path = rowFolder() + QLatin1Char('/') + name;
        return createDiary(path) ? path : QString();
    }

    // As diary(), then saved once per name in 'generations', each a backup generation of its own.
    // Saving is slow (every save flushes to disk): the generations are built once per test function
    // and their folder is copied for each data row.
    QString diaryWithGenerations(const QString& name, const QStringList& generations)
    {
        const QString built = m_dir.filePath(QStringLiteral("generations-") +
                                             QString::fromLatin1(QTest::currentTestFunction()));
        if (!QFileInfo::exists(built)) {
            const QString path = built + QLatin1Char('/') + name;
            if (!QDir().mkpath(built) || !createDiary(path) || !saveGenerations(path, generations)) {
                QDir(built).removeRecursively();
                return QString();
            }
            VDRFileOps::waitForBackgroundRemovals();
        }
        const QString folder = rowFolder();
        for (const QString& file : QDir(built).entryList(QDir::Files | QDir::Hidden)) {
            if (!QFile::copy(built + QLatin1Char('/') + file, folder + QLatin1Char('/') + file))
                return QString();
        }
        return folder + QLatin1Char('/') + name;
    }
};

QTEST_GUILESS_MAIN(TestVDRDocumentSave)
#include "tst_vdrdocumentsave.moc"
