#include "VDRTestFixtures.h"
#include "VDRTestPrompt.h"
#include "app/KeyPressEater.h"
#include "app/VDRMainWindow.h"
#include "app/VDRStartup.h"
#include "document/VDRDocument.h"
#include "editing/VDRCompleter.h"

#include <QAction>
#include <QDir>
#include <QMenu>
#include <QMenuBar>
#include <QProcess>
#include <QSettings>
#include <QTemporaryDir>
#include <QToolBar>
#include <QtTest>

#include <memory>
#include <signal.h>

using namespace VDRTestFixtures;

// Drives the real main window, headless; every question is answered through the test prompt.
class TestVDRMainWindow : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void cleanup();

    void menusAndToolBarInOrder();
    void documentCommandsFollowTheDocument();
    void newDiaryBringsDefaultSuggestionTexts();
    void recentFilesHoldOneEntryPerFile();
    void failedOpenFromCommandGivesNewDiary();
    void closingWithUnsavedChanges_data();
    void closingWithUnsavedChanges();
    void keyPressMarksModified();
    void sessionEndKeepsUnsavedWorkForNextOpening_data();
    void sessionEndKeepsUnsavedWorkForNextOpening();
    void terminationSignalEndsCleanly();
    void firstDocumentRules_data();
    void firstDocumentRules();
    void firstDocumentOpensOrExplains_data();
    void firstDocumentOpensOrExplains();
    void restartCommand_data();
    void restartCommand();
    void demoProjectCannotBeSaved();

private:
    QString diary(const QString& name);
    std::unique_ptr<VDRMainWindow> m_window;
    QTemporaryDir m_dir;
    VDRTestPrompt m_prompt;
};

void TestVDRMainWindow::initTestCase()
{
    QVERIFY(m_dir.isValid());
    isolateSettings(m_dir.filePath(QStringLiteral("settings")));
    qputenv("TMPDIR", QFile::encodeName(m_dir.path()));
}

void TestVDRMainWindow::init()
{
    m_prompt.reset();
    QSettings().remove(VDRMainWindow::recentFileListSettingsKey());
    VDRDocument::setGlobalModified(false);
    m_window = std::make_unique<VDRMainWindow>();
    m_window->show();
}

void TestVDRMainWindow::cleanup()
{
    if (m_window && m_window->document()->isStateValid())
        m_window->document()->closeDocument();
    m_window.reset();
    VDR_VERIFY_PROMPT(m_prompt);
}

QString TestVDRMainWindow::diary(const QString& name)
{
    const QString path = m_dir.filePath(name);
    QFile::remove(path);
    return createDiary(path) ? path : QString();
}

void TestVDRMainWindow::menusAndToolBarInOrder()
{
    QStringList titles;
    for (QAction* a : m_window->menuBar()->actions())
        titles << a->text();
    QCOMPARE(titles, QStringList({"Datei", "Drucken", "Synchronisation", "Stammdaten", "Baubericht",
                                  "Einstellungen", "Ansicht", "Hilfe"}));
    QStringList file;
    for (QAction* a : m_window->ui().menu(QStringLiteral("menuFile"))->actions())
        file << (a->isSeparator() ? QStringLiteral("-")
                 : a->menu()      ? a->menu()->objectName()
                                  : a->objectName());
    QCOMPARE(file, QStringList({"actionFileNew", "actionFileOpen", "menuFileRecent", "actionOpenDemoProject",
                                "menuSyncFiles", "-", "actionFileSave", "actionFileSaveAs", "-",
                                "actionCompactDB", "-", "actionImagesExport", "actionDictationManager",
                                "actionDataExport", "-", "actionFileExit"}));
    QCOMPARE(m_window->ui().action(QStringLiteral("actionStartSpellChecking"))->text(),
             QStringLiteral("Rechtschreibprüfung aus"));
    QStringList tools;
    for (QAction* a : m_window->ui().mainToolBar->actions())
        tools << (a->isSeparator() ? QStringLiteral("-") : a->objectName());
    QCOMPARE(tools.mid(0, 11),
             QStringList({"actionFileNew", "actionFileOpen", "actionFileSave", "-", "actionFilePreviewEntry",
                          "actionFilePDFCurEntry", "actionFilePrintEntries", "actionFilePrintCurEntry",
                          "actionFilePrintEmptyEntry", "actionToolbarPrintCompanyList", "-"}));
    QCOMPARE(tools.last(), QStringLiteral("actionHelpShowHelp"));
    // Commands of later features are there but not yet usable, and say so.
    QAction* later = m_window->ui().action(QStringLiteral("actionMangelListe"));
    QVERIFY(!later->isEnabled());
    QVERIFY(later->toolTip().contains(QStringLiteral("Mängelliste")));

    const QByteArray screenshot = qgetenv("VARDUNA_SCREENSHOT");
    if (!screenshot.isEmpty()) {
        QLocale::setDefault(QLocale(QLocale::German, QLocale::Germany));
        m_window.reset(new VDRMainWindow);
        m_window->show();
        m_window->resize(1280, 800);
        QVERIFY(m_window->createDocument(true));
        QTest::qWait(100);
        QVERIFY(m_window->grab().save(QString::fromLocal8Bit(screenshot)));
    }
}

void TestVDRMainWindow::documentCommandsFollowTheDocument()
{
    QAction* save = m_window->ui().action(QStringLiteral("actionFileSave"));
    QVERIFY(!save->isEnabled());
    m_window->ui().action(QStringLiteral("actionFileNew"))->trigger();
    QVERIFY(m_window->document()->isStateNew());
    QVERIFY(save->isEnabled());
    QVERIFY(m_window->closeDocument(false));
    QVERIFY(!save->isEnabled());
}

void TestVDRMainWindow::newDiaryBringsDefaultSuggestionTexts()
{
    QSettings settings;
    settings.remove(VDRCompleter::settingsGroup());
    m_window->ui().action(QStringLiteral("actionFileNew"))->trigger();
    const QString group = VDRCompleter::settingsGroup();
    QCOMPARE(settings.value(group + QStringLiteral("/Mängel/Raumname/values/size")).toInt(), 6);
    QCOMPARE(settings.value(group + QStringLiteral("/Mängel/Raumbuch-Nr./values/1/centry")).toString(),
             QStringLiteral("UG-001"));
    QCOMPARE(settings.value(group + QStringLiteral("/Baustoffe/Einheit/values/size")).toInt(), 5);
    // A list the user changed is not overwritten by the next new diary.
    settings.setValue(group + QStringLiteral("/Baustoffe/Einheit/values/1/centry"), QStringLiteral("Sack"));
    QVERIFY(m_window->createDocument(true));
    QCOMPARE(settings.value(group + QStringLiteral("/Baustoffe/Einheit/values/1/centry")).toString(),
             QStringLiteral("Sack"));
}

void TestVDRMainWindow::recentFilesHoldOneEntryPerFile()
{
    const QString a = diary(QStringLiteral("a.vd2"));
    const QString b = diary(QStringLiteral("b.vd2"));
    QCOMPARE(m_window->openDocument(a, false, true), 0);
    QCOMPARE(m_window->openDocument(b, false, true), 0);
    // The same file again, by a relative path.
    const QString relative = QDir::current().relativeFilePath(a);
    QCOMPARE(m_window->openDocument(relative, false, true), 0);
    QCOMPARE(m_window->recentFiles(),
             QStringList({QFileInfo(a).absoluteFilePath(), QFileInfo(b).absoluteFilePath()}));
    QCOMPARE(QSettings().value(VDRMainWindow::recentFileListSettingsKey()).toStringList(),
             m_window->recentFiles());
    QCOMPARE(m_window->ui().menuFileRecent->actions().first()->text(), QStringLiteral("a.vd2"));

    // A recent file that has gone is dropped from the list when it fails to open.
    QVERIFY(m_window->closeDocument(false));
    QVERIFY(QFile::remove(b));
    m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("existiert nicht."));
    m_window->ui().menuFileRecent->actions().at(1)->trigger();
    QCOMPARE(m_window->recentFiles(), QStringList{QFileInfo(a).absoluteFilePath()});
    QVERIFY(m_window->document()->isStateNew()); // a failed open leaves a new diary
}

void TestVDRMainWindow::failedOpenFromCommandGivesNewDiary()
{
    m_prompt.expectFileName(m_dir.filePath(QStringLiteral("gibt es nicht.vd2")));
    m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("existiert nicht."));
    m_window->ui().action(QStringLiteral("actionFileOpen"))->trigger();
    QVERIFY(m_window->document()->isStateValid());
    QVERIFY(m_window->document()->isStateNew());
}

void TestVDRMainWindow::closingWithUnsavedChanges_data()
{
    QTest::addColumn<int>("answer");
    QTest::addColumn<bool>("closed");
    QTest::addColumn<QString>("savedName");
    QTest::newRow("cancel keeps window and document") << int(VDRPrompt::Cancel) << false << "Neues Varduna";
    QTest::newRow("discard") << int(VDRPrompt::Discard) << true << "Neues Varduna";
    QTest::newRow("save") << int(VDRPrompt::Save) << true << "Geändert";
}

void TestVDRMainWindow::closingWithUnsavedChanges()
{
    QFETCH(int, answer);
    QFETCH(bool, closed);
    QFETCH(QString, savedName);
    const QString path = diary(QStringLiteral("schliessen.vd2"));
    QCOMPARE(m_window->openDocument(path, false, true), 0);
    VDRDocument* doc = m_window->document();
    QVERIFY(doc->modelVdr()->setData(0, QStringLiteral("name"), QStringLiteral("Geändert")));
    QVERIFY(doc->modelVdr()->submitAll());
    VDRDocument::setGlobalModified(true);

    m_prompt.expect(QStringLiteral("Dokument geändert"),
                    QStringLiteral("Möchten Sie die Änderungen speichern?"), answer);
    QCOMPARE(m_window->close(), closed);
    QCOMPARE(doc->isStateValid(), !closed);
    if (!closed) {
        QVERIFY(m_window->isVisible());
        QVERIFY(QFile::exists(path + QStringLiteral(".workingcopy")));
        return;
    }
    QCOMPARE(queryValue(path, "SELECT name FROM vdr").toString(), savedName);
    QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
}

void TestVDRMainWindow::keyPressMarksModified()
{
    KeyPressEater eater;
    qApp->installEventFilter(&eater);
    QVERIFY(m_window->createDocument(true));
    QVERIFY(!m_window->document()->isStateModified());
    QTest::keyClick(m_window.get(), Qt::Key_Shift);
    qApp->removeEventFilter(&eater);
    QVERIFY(m_window->document()->isStateModified());
    m_prompt.expect(QStringLiteral("Dokument geändert"), QString(), VDRPrompt::Discard);
    QVERIFY(m_window->closeDocument(true));
}

void TestVDRMainWindow::sessionEndKeepsUnsavedWorkForNextOpening_data()
{
    QTest::addColumn<bool>("modified");
    QTest::newRow("unsaved changes") << true;
    QTest::newRow("nothing changed") << false;
}

void TestVDRMainWindow::sessionEndKeepsUnsavedWorkForNextOpening()
{
    QFETCH(bool, modified);
    const QString path = diary(QStringLiteral("abmelden.vd2"));
    QCOMPARE(m_window->openDocument(path, false, true), 0);
    if (modified) {
        QVERIFY(m_window->document()->modelVdr()->setData(0, QStringLiteral("name"),
                                                          QStringLiteral("Nicht gespeichert")));
        QVERIFY(m_window->document()->modelVdr()->submitAll());
        VDRDocument::setGlobalModified(true);
    }
    m_window->endSession();
    QCOMPARE(QFile::exists(path + QStringLiteral(".workingcopy")), modified);
    QCOMPARE(QFile::exists(VDRDocument::lockInfoPathFor(path)), modified);

    VDRDocument::setGlobalModified(false);
    if (modified)
        m_prompt.expect(QStringLiteral("Datei öffnen"), QStringLiteral("nicht ordnungsgemäß abgeschlossen"));
    QCOMPARE(m_window->openDocument(path, false, true), 0);
    QCOMPARE(m_window->document()->projectName(),
             modified ? QStringLiteral("Nicht gespeichert") : QStringLiteral("Neues Varduna"));
}

void TestVDRMainWindow::terminationSignalEndsCleanly()
{
    // The real program in a process of its own: while it holds the diary, the command-line tool
    // sees it held; SIGTERM without changes closes it properly.
    const QString path = diary(QStringLiteral("signal.vd2"));
    QProcess app;
    QProcessEnvironment env = QProcessEnvironment::systemEnvironment();
    env.insert(QStringLiteral("QT_QPA_PLATFORM"), QStringLiteral("offscreen"));
    env.insert(QStringLiteral("XDG_CONFIG_HOME"), m_dir.filePath(QStringLiteral("settings")));
    app.setProcessEnvironment(env);
    app.start(QCoreApplication::applicationDirPath() + QStringLiteral("/varduna"), {path});
    QVERIFY(app.waitForStarted());
    QTRY_VERIFY_WITH_TIMEOUT(QFile::exists(VDRDocument::lockInfoPathFor(path)), 20000);

    QProcess check;
    check.setProcessEnvironment(env);
    check.start(QCoreApplication::applicationDirPath() + QStringLiteral("/varduna-cli"),
                {QStringLiteral("check"), path});
    QVERIFY(check.waitForFinished(30000));
    QCOMPARE(check.exitCode(), 4);

    ::kill(pid_t(app.processId()), SIGTERM);
    QVERIFY(app.waitForFinished(20000));
    QCOMPARE(app.exitStatus(), QProcess::NormalExit);
    QCOMPARE(app.exitCode(), 0);
    QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
    QVERIFY(!QFile::exists(VDRDocument::lockInfoPathFor(path)));
}

void TestVDRMainWindow::firstDocumentRules_data()
{
    QTest::addColumn<QString>("desktopFile");
    QTest::addColumn<QString>("reopen");
    QTest::addColumn<QStringList>("arguments");
    QTest::addColumn<QString>("expected");
    QTest::newRow("desktop file first") << "finder.vd2"
                                        << "reopen.vd2" << QStringList{"arg.vd2"} << "finder.vd2";
    QTest::newRow("re-open key next") << QString() << "reopen.vd2" << QStringList{"arg.vd2"} << "reopen.vd2";
    QTest::newRow("one argument") << QString() << QString() << QStringList{"arg.vd2"} << "arg.vd2";
    QTest::newRow("-file") << QString() << QString() << QStringList{"-style", "x", "-file", "f.vd2"}
                           << "f.vd2";
    QTest::newRow("first -file wins")
        << QString() << QString() << QStringList{"-file", "a.vd2", "-file", "b.vd2"} << "a.vd2";
    QTest::newRow("-file without path") << QString() << QString() << QStringList{"-x", "-file"} << QString();
    QTest::newRow("nothing") << QString() << QString() << QStringList() << QString();
}

void TestVDRMainWindow::firstDocumentRules()
{
    QFETCH(QString, desktopFile);
    QFETCH(QString, reopen);
    QFETCH(QStringList, arguments);
    QFETCH(QString, expected);
    QSettings settings;
    if (!reopen.isEmpty())
        settings.setValue(VDRStartup::reopenSettingsKey(), reopen);
    QCOMPARE(VDRStartup::firstDocumentPath(desktopFile, settings, arguments), expected);
    // The re-open key is used once at most.
    QCOMPARE(settings.contains(VDRStartup::reopenSettingsKey()), !reopen.isEmpty() && !desktopFile.isEmpty());
    settings.remove(VDRStartup::reopenSettingsKey());
}

void TestVDRMainWindow::firstDocumentOpensOrExplains_data()
{
    QTest::addColumn<QString>("kind");
    QTest::addColumn<bool>("opened");
    QTest::newRow("diary") << "diary" << true;
    QTest::newRow("exchange file starts a new diary") << "vdx" << true;
    QTest::newRow("missing file") << "missing" << false;
}

void TestVDRMainWindow::firstDocumentOpensOrExplains()
{
    QFETCH(QString, kind);
    QFETCH(bool, opened);
    QString path = m_dir.filePath(QStringLiteral("nicht da.vd2"));
    if (kind == QLatin1String("diary"))
        path = diary(QStringLiteral("start.vd2"));
    else if (kind == QLatin1String("vdx"))
        path = m_dir.filePath(QStringLiteral("vom Handy.vdx"));
    else
        m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("existiert nicht."));
    QCOMPARE(VDRStartup::openFirstDocument(*m_window, path), opened);
    QCOMPARE(m_window->document()->isStateValid(), opened);
    // The window stays usable: a new diary can be created.
    QVERIFY(m_window->ui().action(QStringLiteral("actionFileNew"))->isEnabled());
}

void TestVDRMainWindow::restartCommand_data()
{
    QTest::addColumn<QStringList>("arguments");
    QTest::addColumn<QString>("program");
    QTest::addColumn<QStringList>("rest");
    QTest::newRow("no arguments") << QStringList{"/opt/varduna"} << "/opt/self" << QStringList();
    QTest::newRow("arguments") << QStringList{"/opt/varduna", "/opt/other", "-file", "x.vd2"} << "/opt/other"
                               << QStringList{"-file", "x.vd2"};
}

void TestVDRMainWindow::restartCommand()
{
    QFETCH(QStringList, arguments);
    QFETCH(QString, program);
    QFETCH(QStringList, rest);
    const auto command = VDRStartup::restartCommand(arguments, QStringLiteral("/opt/self"));
    QCOMPARE(command.first, program);
    QCOMPARE(command.second, rest);
}

void TestVDRMainWindow::demoProjectCannotBeSaved()
{
    if (!QFile::exists(VDRMainWindow::demoProjectPath()))
        QSKIP("the demo project is generated by the build");
    m_window->ui().action(QStringLiteral("actionOpenDemoProject"))->trigger();
    QVERIFY(m_window->document()->isDemoProject());
    QVERIFY(m_window->recentFiles().isEmpty()); // not a recent file
    QVERIFY(m_window->windowTitle().contains(QStringLiteral("Musterprojekt")));
    for (const char* command : {"actionFileSave", "actionFileSaveAs"}) {
        m_prompt.expect(QStringLiteral("Speichern"),
                        QStringLiteral("Das Musterprojekt kann nicht gespeichert werden."));
        m_window->ui().action(QLatin1String(command))->trigger();
    }
    m_prompt.expect(QStringLiteral("Datenbank bereinigen"),
                    QStringLiteral("für das Musterprojekt nicht möglich"));
    m_window->ui().action(QStringLiteral("actionCompactDB"))->trigger();
    QVERIFY(m_window->closeDocument(false));
}

QTEST_MAIN(TestVDRMainWindow)
#include "tst_vdrmainwindow.moc"
