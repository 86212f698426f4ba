#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "document/VDRDocument.h"
#include "document/VDRFileOps.h"

#include <QDir>
#include <QProcess>
#include <QScopeGuard>
#include <QSignalSpy>
#include <QtTest>

#include <signal.h>
#include <unistd.h>

using namespace VDRTestFixtures;

namespace {

QString helperPath(const char* name)
{
    return QCoreApplication::applicationDirPath() + QLatin1Char('/') + QLatin1String(name);
}

// A second process holding a diary open, like another running instance.
class Holder
{
public:
    explicit Holder(const QString& diary, const QString& user = QString())
    {
        QProcessEnvironment env = QProcessEnvironment::systemEnvironment();
        if (!user.isEmpty())
            env.insert(QStringLiteral("USER"), user);
        m_process.setProcessEnvironment(env);
        m_process.start(helperPath("tst_holder"), {diary});
    }
    ~Holder()
    {
        if (m_process.state() != QProcess::NotRunning) {
            m_process.kill();
            m_process.waitForFinished();
        }
    }
    bool waitFor(const QByteArray& word)
    {
        while (!m_buffer.contains(word)) {
            if (!m_process.waitForReadyRead(20000))
                return false;
            m_buffer += m_process.readAllStandardOutput();
        }
        return true;
    }
    void send(const QByteArray& line) { m_process.write(line + '\n'); }
    void quit()
    {
        send("quit");
        m_process.closeWriteChannel();
        m_process.waitForFinished();
    }
    void crash()
    {
        ::kill(static_cast<pid_t>(m_process.processId()), SIGKILL);
        m_process.waitForFinished();
    }

private:
    QProcess m_process;
    QByteArray m_buffer;
};
} // namespace

class TestVDRDocument : public VDRTestCase
{
    Q_OBJECT

    void initTest() override { VDRFileOps::setFailurePredicate(nullptr); }
    void cleanupTest() override { VDRFileOps::setFailurePredicate(nullptr); }

private slots:
    void createDocument()
    {
        VDRDocument doc;
        QSignalSpy opened(&doc, &VDRDocument::documentOpened);
        QSignalSpy closed(&doc, &VDRDocument::documentClosed);
        VDRDocument::setGlobalModified(true);
        QVERIFY(doc.createDocument(true));
        QVERIFY(doc.isStateValid());
        QVERIFY(doc.isStateNew());
        QVERIFY(!doc.isStateModified());
        QVERIFY(doc.getFilepath().isEmpty());
        QCOMPARE(opened.count(), 1);
        QVERIFY(!doc.createDocument(true)); // one document at a time
        const QString workingCopy = doc.getFilepathWorkingCopy();
        QVERIFY(QFile::exists(workingCopy));
        QVERIFY(QFileInfo(doc.temporaryFolder()).isDir());
        QVERIFY(doc.closeDocument());
        QCOMPARE(closed.count(), 1);
        QVERIFY(!QFile::exists(workingCopy));
        QVERIFY(!doc.isStateValid());
    }

    void openAndCloseLeaveNothingBehind()
    {
        // Blanks and umlauts in folder and file name.
        const QString path = newDiary(QStringLiteral("Bau Ölweg/Tagebuch März 2026.vd2"));
        QVERIFY(!path.isEmpty());
        const QByteArray before = fileHash(path);

        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        QCOMPARE(doc.getFilepathWorkingCopy(), path + QStringLiteral(".workingcopy"));
        const QString lockInfo = QFileInfo(path).path() + QStringLiteral("/Tagebuch März 2026.udf");
        const QStringList holder = VDRDocument::readLockInfo(lockInfo);
        QCOMPARE(holder.size(), 4);
        QCOMPARE(holder[0], VDRDocument::currentUserName());
        QCOMPARE(holder[1], VDRDocument::currentComputerName());
        QCOMPARE(holder[2], QDate::currentDate().toString());
        QVERIFY(QTime::fromString(holder[3], QStringLiteral("hh:mm")).isValid());
        QCOMPARE(doc.projectName(), QStringLiteral("Neues Varduna"));
        QVERIFY(!doc.isStateModified());

        QVERIFY(doc.closeDocument());
        QCOMPARE(QDir(QFileInfo(path).path()).entryList(QDir::Files),
                 QStringList{QFileInfo(path).fileName()});
        QCOMPARE(fileHash(path), before);
    }

    void refusedFilesStayUntouched_data()
    {
        QTest::addColumn<QString>("kind");
        QTest::addColumn<QString>("title");
        QTest::addColumn<QString>("text");
        // clang-format off
        QTest::newRow("missing") << "missing" << "Dateifehler" << "existiert nicht.";
        QTest::newRow("folder") << "folder" << "Dateifehler" << "ist keine Datei.";
        QTest::newRow("empty file") << "empty" << "Dateifehler" << "ist keine Varduna-Datei.";
        QTest::newRow("text file") << "text" << "Dateifehler" << "ist keine Varduna-Datei.";
        QTest::newRow("version 0.5") << "0.5" << "Datei öffnen" << "mit einer neueren Programmversion erstellt";
        QTest::newRow("version 0.10") << "0.10" << "Datei öffnen" << "mit einer neueren Programmversion erstellt";
        QTest::newRow("other database") << "foreign" << "Datenbankfehler" << "Tabelle vdr fehlt";
        QTest::newRow("damaged, cancelled") << "damaged" << "Beschädigte Datenbank-Datei"
                                            << "Es existieren keine Backup-Dateien.";
        // clang-format on
    }

    void refusedFilesStayUntouched()
    {
        QFETCH(QString, kind);
        QFETCH(QString, title);
        QFETCH(QString, text);

        const QString path = m_dir.filePath(QStringLiteral("refused/%1.vd2").arg(kind));
        QDir().mkpath(m_dir.filePath(QStringLiteral("refused")));
        if (kind == QLatin1String("folder")) {
            QDir().mkpath(path);
        } else if (kind == QLatin1String("empty") || kind == QLatin1String("text")) {
            QVERIFY(writeFile(path, kind == QLatin1String("text")
                                        ? "Dies ist kein Bautagebuch, sondern ein Einkaufszettel.\n"
                                        : ""));
        } else if (kind.startsWith(QLatin1String("0."))) {
            QVERIFY(createDiary(path));
            QVERIFY(execSql(
                path, {QStringLiteral("UPDATE meta SET value = '%1' WHERE key = 'fileversion'").arg(kind)}));
        } else if (kind == QLatin1String("foreign")) {
            QVERIFY(execSql(path, {"CREATE TABLE meta (key TEXT PRIMARY KEY, value TEXT NOT NULL)",
                                   "CREATE TABLE kunden (id INTEGER, name TEXT)"}));
        } else if (kind == QLatin1String("damaged")) {
            QVERIFY(createDiary(path));
            QVERIFY(damageFile(path));
        }
        const QByteArray before = fileHash(path);

        VDRDocument doc;
        bool reportedShowError = true;
        m_prompt.expect(title, text, kind == QLatin1String("damaged") ? 0 : -1);
        QVERIFY(!doc.openDocument(path, reportedShowError));
        QVERIFY(!reportedShowError); // the refusal explained itself
        QVERIFY(!doc.isStateValid());
        QCOMPARE(fileHash(path), before);
        QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
        QVERIFY(!QFile::exists(VDRDocument::lockInfoPathFor(path)));
        QCOMPARE(m_prompt.busyDepth(), 0);
    }

    void damagedFileCanBeOpenedAnyway()
    {
        const QString path = newDiary(QStringLiteral("beschaedigt.vd2"));
        QVERIFY(damageFile(path));
        VDRDocument doc;
        bool showError = true;
        m_prompt.expect(QStringLiteral("Beschädigte Datenbank-Datei"), QStringLiteral("drohen Datenverluste"),
                        1);
        // What follows depends on how badly SQLite is hurt; it must end in a message, not a crash.
        const bool opened = doc.openDocument(path, showError);
        if (!opened) {
            QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
            // The refusal after the question is explained by a message of its own.
            QVERIFY(m_prompt.messages.size() >= 2);
            QCOMPARE(m_prompt.messages.last().title, QStringLiteral("SQL Error"));
            QCOMPARE(m_prompt.messages.last().text, QStringLiteral("database disk image is malformed"));
            m_prompt.reset();
        } else {
            QVERIFY(doc.closeDocument());
        }
    }

    void leftoverWorkingCopy_data()
    {
        QTest::addColumn<QString>("user");
        QTest::addColumn<QString>("computer");
        QTest::addColumn<bool>("corrupt");
        QTest::addColumn<bool>("resumed");

        const QString me = VDRDocument::currentUserName();
        const QString here = VDRDocument::currentComputerName();
        QTest::newRow("same user, same computer") << me << here << false << true;
        QTest::newRow("other user") << "fremd" << here << false << false;
        QTest::newRow("other computer") << me << "anderer-pc" << false << false;
        QTest::newRow("no lock information") << QString() << QString() << false << false;
        QTest::newRow("corrupt copy of same user") << me << here << true << false;
    }

    void leftoverWorkingCopy()
    {
        QFETCH(QString, user);
        QFETCH(QString, computer);
        QFETCH(bool, corrupt);
        QFETCH(bool, resumed);

        const QString path = newDiary(QStringLiteral("rest.vd2"));
        const QString workingCopy = leaveWorkingCopy(path, user, computer);
        const QString lockInfo = VDRDocument::lockInfoPathFor(path);
        QVERIFY(!workingCopy.isEmpty());
        if (corrupt)
            QVERIFY(damageFile(workingCopy));
        // A journal left by the crash must go with its working copy.
        if (!resumed)
            QVERIFY(writeFile(workingCopy + QStringLiteral("-journal"), QByteArray(512, '\0')));

        VDRDocument doc;
        if (resumed)
            m_prompt.expect(
                QStringLiteral("Datei öffnen"),
                QStringLiteral("Die letzte Bearbeitung der Varduna-Datei wurde nicht ordnungsgemäß "
                               "abgeschlossen.\nDer letzte Bearbeitungsstand wird geöffnet."));
        QVERIFY(openDiary(doc, path));
        QCOMPARE(doc.projectName(),
                 resumed ? QStringLiteral("Ungespeicherter Stand") : QStringLiteral("Neues Varduna"));
        QCOMPARE(doc.isStateModified(), resumed);
        QCOMPARE(VDRDocument::readLockInfo(lockInfo).value(0), VDRDocument::currentUserName());
        QVERIFY(doc.closeDocument());
        QVERIFY(!QFile::exists(workingCopy));
        QVERIFY(!QFile::exists(workingCopy + QStringLiteral("-journal")));
    }

    void fileHeldByAnotherProcess_data()
    {
        QTest::addColumn<bool>("withLockInfo");
        QTest::newRow("with lock information") << true;
        QTest::newRow("lock information lost") << false;
    }

    void fileHeldByAnotherProcess()
    {
        QFETCH(bool, withLockInfo);
        const QString path = newDiary(QStringLiteral("gehalten.vd2"));
        Holder holder(path, QStringLiteral("kollegin"));
        QVERIFY(holder.waitFor("ready"));
        if (!withLockInfo)
            QVERIFY(QFile::remove(VDRDocument::lockInfoPathFor(path)));

        VDRDocument doc;
        bool showError = true;
        if (withLockInfo)
            m_prompt.expect(
                QStringLiteral("Datenbank in Bearbeitung"),
                QStringLiteral("da sie in Bearbeitung ist von\nUser: kollegin\nComputer: %1\nseit dem %2 ")
                    .arg(VDRDocument::currentComputerName(),
                         QDate::currentDate().toString(QStringLiteral("dd.MM.yyyy"))));
        else
            m_prompt.expect(
                QStringLiteral("Datenbank in Bearbeitung"),
                QStringLiteral("Die Datei konnte nicht geöffnet werden, da sie in Bearbeitung ist."));
        QVERIFY(!doc.openDocument(path, showError));
        QVERIFY(!showError);
        // The holder keeps its working copy.
        QVERIFY(QFile::exists(path + QStringLiteral(".workingcopy")));
        holder.quit();
        QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
    }

    void crashedInstanceIsResumedOnlyBySameUser_data()
    {
        QTest::addColumn<QString>("user");
        QTest::addColumn<bool>("resumed");
        QTest::newRow("same user") << QString() << true;
        QTest::newRow("other user") << "kollege" << false;
    }

    void crashedInstanceIsResumedOnlyBySameUser()
    {
        QFETCH(QString, user);
        QFETCH(bool, resumed);
        const QString path = newDiary(QStringLiteral("absturz.vd2"));
        {
            Holder holder(path, user);
            QVERIFY(holder.waitFor("ready"));
            holder.send("modify");
            QVERIFY(holder.waitFor("modified"));
            holder.crash();
        }
        QVERIFY(QFile::exists(path + QStringLiteral(".workingcopy")));

        VDRDocument doc;
        if (resumed)
            m_prompt.expect(QStringLiteral("Datei öffnen"),
                            QStringLiteral("nicht ordnungsgemäß abgeschlossen"));
        QVERIFY(openDiary(doc, path));
        QCOMPARE(doc.projectName(),
                 resumed ? QStringLiteral("Geändert im Holder") : QStringLiteral("Neues Varduna"));
        QVERIFY(doc.closeDocument());
    }

    void readOnlyDiaryWarns()
    {
        const QString path = newDiary(QStringLiteral("schreibgeschuetzt.vd2"));
        const QString absolute = QFileInfo(path).absoluteFilePath();
        // Root may write anything, so the refusal is simulated where the program asks.
        VDRFileOps::setFailurePredicate([absolute](VDRFileOps::Op op, const QString& p) {
            return op == VDRFileOps::CheckWritable && p == absolute;
        });
        VDRDocument doc;
        m_prompt.expect(QStringLiteral("Datei-Warnung"),
                        QStringLiteral("Sie haben keine Schreibrechte für die Datei %1.\n")
                            .arg(QDir::toNativeSeparators(absolute)));
        QVERIFY(openDiary(doc, path));
        QVERIFY(doc.isStateValid());
        QVERIFY(doc.closeDocument());
    }

    void temporaryFilesAreRemovedOnClose()
    {
        VDRDocument doc;
        QVERIFY(doc.createDocument(false));
        const QString a = doc.getFreeTempFile(QStringLiteral("jpg"));
        const QString b = doc.getFreeTempFile(QString());
        QVERIFY(a.endsWith(QLatin1String(".jpg")));
        QVERIFY(a.startsWith(QDir::tempPath() + QStringLiteral("/vdn_temp.")));
        QVERIFY(a != b);
        const QString folder = doc.temporaryFolder();
        const QString inFolder = folder + QStringLiteral("/bild.jpg");
        for (const QString& name : {a, b, inFolder})
            QVERIFY(writeFile(name, "x"));
        QVERIFY(doc.closeDocument());
        for (const QString& name : {a, b, inFolder, folder})
            QVERIFY2(!QFileInfo::exists(name), qPrintable(name));
    }

    void resumedCopyIsNeverLost_data()
    {
        QTest::addColumn<QString>("kind");
        QTest::addColumn<bool>("opens");
        QTest::newRow("inspected") << "inspected" << true;
        QTest::newRow("leftover dummy row") << "dummy" << true;
        QTest::newRow("copy that cannot be written") << "immutable" << false;
        QTest::newRow("full disk") << "full" << false;
    }

    // The working copy left by a crash holds the only state of unsaved work: no opening may lose it.
    void resumedCopyIsNeverLost()
    {
        QFETCH(QString, kind);
        QFETCH(bool, opens);
        const QString folder = m_dir.filePath(QStringLiteral("rest-") + kind);
        std::unique_ptr<SmallDisk> disk;
        if (kind == QLatin1String("full")) {
            disk = std::make_unique<SmallDisk>(folder, 1024 * 1024);
            if (!disk->isMounted())
                QSKIP("no small file system can be mounted here");
        }
        const QString path = newDiary(QStringLiteral("rest-%1/rest.vd2").arg(kind));
        const QString workingCopy =
            leaveWorkingCopy(path, VDRDocument::currentUserName(), VDRDocument::currentComputerName());
        QVERIFY(!workingCopy.isEmpty());
        if (kind == QLatin1String("dummy"))
            QVERIFY(execSql(workingCopy, {"INSERT INTO meta (key, value) VALUES ('dummy', 'dummy')"}));
        const bool immutable = kind == QLatin1String("immutable");
        auto mutableAgain = qScopeGuard([&] {
            if (immutable)
                setImmutable(workingCopy, false);
        });
        if (immutable && !setImmutable(workingCopy, true))
            QSKIP("the file system cannot make a file immutable");
        if (disk)
            QVERIFY(disk->fill());
        const QStringList before = folderState(folder);

        VDRDocument doc;
        doc.setInspecting(kind == QLatin1String("inspected"));
        bool showError = true;
        if (opens)
            m_prompt.expect(QStringLiteral("Datei öffnen"),
                            QStringLiteral("Der letzte Bearbeitungsstand wird geöffnet."));
        else
            m_prompt.expect(
                QStringLiteral("Datenbankfehler"),
                QStringLiteral("Die Datei bleibt erhalten, damit keine ungespeicherten Änderungen "
                               "verloren gehen."));
        QCOMPARE(doc.openDocument(path, showError), opens);
        if (opens) {
            QCOMPARE(doc.projectName(), QStringLiteral("Ungespeicherter Stand"));
            QVERIFY(doc.closeDocument());
        }
        QCOMPARE(showError, opens); // a refusal explained itself
        if (kind == QLatin1String("dummy")) {
            QVERIFY(!QFile::exists(workingCopy)); // closed properly, as any opening
        } else {
            QCOMPARE(folderState(folder), before);
        }
    }

    // A journal whose working copy is gone (deleted by hand or by a sync client) is not the journal of
    // the next fresh copy: rolled into it, it would make the next save write a damaged diary.
    void strayJournalNeverReachesTheDiary()
    {
        const QString path = newDiary(QStringLiteral("streu/tagebuch.vd2"));
        // A hot journal as SQLite writes one: a header, then page 2's "original" content with its checksum.
        QByteArray journal = QByteArray::fromHex("d9d505f920a163d7");
        QDataStream header(&journal, QIODevice::Append);
        header << quint32(1) << quint32(0) << quint32(QFileInfo(path).size() / 4096) << quint32(512)
               << quint32(4096);
        journal = journal.leftJustified(512, '\0');
        const QByteArray page(4096, '\xA5');
        quint32 checksum = 0;
        for (int i = 4096 - 200; i > 0; i -= 200)
            checksum += quint8(page[i]);
        QDataStream record(&journal, QIODevice::Append);
        record << quint32(2);
        journal += page;
        record.device()->seek(journal.size());
        record << checksum;
        QVERIFY(writeFile(path + QStringLiteral(".workingcopy-journal"), journal));

        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        QVERIFY(doc.modelVdr()->setData(0, QStringLiteral("name"), QStringLiteral("Gespeichert")));
        QVERIFY(doc.modelVdr()->submitAll());
        QCOMPARE(doc.saveDocument(), 0);
        QVERIFY(doc.closeDocument());
        QVERIFY(isIntact(path));
        QCOMPARE(projectNameIn(path), QStringLiteral("Gespeichert"));
    }

    void openingNeverWritesTheDiary_data()
    {
        QTest::addColumn<bool>("unreadable");
        QTest::addColumn<bool>("inspecting");
        QTest::newRow("intact") << false << false;
        QTest::newRow("intact, inspected") << false << true;
        QTest::newRow("no integrity result") << true << false;
        QTest::newRow("no integrity result, inspected") << true << true;
    }

    // Only saving, restoring and compacting change a diary's bytes; opening and closing never do.
    void openingNeverWritesTheDiary()
    {
        QFETCH(bool, unreadable);
        QFETCH(bool, inspecting);
        const QString path = newDiary(QStringLiteral("unberuehrt.vd2"));
        if (unreadable) {
            QVERIFY(damageSchemaPage(path));
            m_prompt.expect(QStringLiteral("Beschädigte Datenbank-Datei"),
                            QStringLiteral("Es existieren keine Backup-Dateien."), 1);
            m_prompt.expect(QStringLiteral("SQL Error"), QStringLiteral("malformed"));
        }
        const QByteArray hash = fileHash(path);
        VDRDocument doc;
        doc.setInspecting(inspecting);
        bool showError = true;
        if (doc.openDocument(path, showError))
            QVERIFY(doc.closeDocument());
        QCOMPARE(fileHash(path), hash);
    }

    void lostWorkingCopyFailsTheReopening()
    {
        const QString path = newDiary(QStringLiteral("verloren.vd2"));
        VDRDocument doc;
        QVERIFY(openDiary(doc, path));
        QVERIFY(QFile::remove(doc.getFilepathWorkingCopy()));
        m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("existiert nicht mehr."));
        QVERIFY(!doc.reopenWorkingCopyAfterError());
        QVERIFY(!QFile::exists(doc.getFilepathWorkingCopy())); // no empty database made in its place
        doc.closeDocument();
    }

private:
    // What a crash leaves: a working copy with unsaved work, and the lock information when 'user' is set.
    static QString leaveWorkingCopy(const QString& path, const QString& user, const QString& computer)
    {
        const QString workingCopy = path + QStringLiteral(".workingcopy");
        const QString lockInfo = VDRDocument::lockInfoPathFor(path);
        QFile::remove(workingCopy);
        QFile::remove(lockInfo);
        if (!QFile::copy(path, workingCopy) ||
            !execSql(workingCopy, {"UPDATE vdr SET name = 'Ungespeicherter Stand'"}))
            return QString();
        const QString info = QStringLiteral("%1\n%2\nSo. Dez. 6 2026\n09:15\n").arg(user, computer);
        return user.isEmpty() || writeFile(lockInfo, info.toUtf8()) ? workingCopy : QString();
    }
};

QTEST_GUILESS_MAIN(TestVDRDocument)
#include "tst_vdrdocument.moc"
