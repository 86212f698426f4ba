#include "VDRExchangeFileBuilder.h"
#include "VDRTestCase.h"
#include "VDRTestFixtures.h"
#include "app/KeyPressEater.h"
#include "app/VDRMainWindow.h"
#include "app/VDRStartup.h"
#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDatabaseSchema.h"
#include "document/VDRDocument.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/reportlist/VDREntrySelectorWidget.h"
#include "printing/VDRPrintHooks.h"

#include <QAction>
#include <QDesktopServices>
#include <QDir>
#include <QDockWidget>
#include <QLabel>
#include <QLineEdit>
#include <QLockFile>
#include <QMenu>
#include <QMenuBar>
#include <QMessageBox>
#include <QProcess>
#include <QPushButton>
#include <QScopeGuard>
#include <QScreen>
#include <QSettings>
#include <QSqlQuery>
#include <QStatusBar>
#include <QToolBar>
#include <QTranslator>
#include <QtTest>

#include <memory>
#include <signal.h>

using namespace VDRTestFixtures;

namespace {
QString plain(const QString& text)
{
    return Ui_VDRMainWindowClass::plainText(text);
}
} // namespace

// Drives the real main window, headless; every question is answered through the test prompt.
class TestVDRMainWindow : public VDRTestCase
{
    Q_OBJECT

public slots:
    // Stands in for the system's browser.
    void openUrl(const QUrl& url) { m_openedUrls << url; }

private:
    void initRun() override { QDesktopServices::setUrlHandler(QStringLiteral("file"), this, "openUrl"); }

    void initTest() override
    {
        m_openedUrls.clear();
        QSettings().remove(VDRMainWindow::recentFileListSettingsKey());
        VDRDocument::setGlobalModified(false);
        m_window = std::make_unique<VDRMainWindow>();
        m_window->show();
    }

    void cleanupTest() override
    {
        if (m_window && m_window->document()->isStateValid())
            m_window->document()->closeDocument();
        m_window.reset();
    }

private slots:
    void menusAndToolBarInOrder()
    {
        QStringList titles;
        for (QAction* a : m_window->menuBar()->actions()) {
            QVERIFY2(a->menu(), qPrintable(a->text()));
            titles << plain(a->text());
        }
        titles.sort();
        QCOMPARE(titles, QStringList({"Ansicht", "Baubericht", "Datei", "Drucken", "Einstellungen", "Hilfe",
                                      "Stammdaten", "Synchronisation"}));
        QCOMPARE(plain(m_window->ui().action(QStringLiteral("actionStartSpellChecking"))->text()),
                 QStringLiteral("Rechtschreibprüfung aus"));
        // Every entry of a menu has a mnemonic of its own.
        for (QMenu* menu : m_window->menuBar()->findChildren<QMenu*>()) {
            QSet<QChar> mnemonics;
            int entries = 0;
            for (QAction* a : menu->actions()) {
                if (a->isSeparator())
                    continue;
                ++entries;
                const int at = a->text().indexOf(QLatin1Char('&'));
                QVERIFY2(at >= 0, qPrintable(a->text()));
                mnemonics << a->text().at(at + 1).toLower();
            }
            QCOMPARE(mnemonics.size(), entries);
        }
        // Every command has a menu, but the tool bar's own buttons and the window's own keys.
        for (QAction* a : m_window->ui().allActions()) {
            const QList<QWidget*> places = a->associatedWidgets();
            const bool inMenu = std::any_of(places.begin(), places.end(),
                                            [](QWidget* w) { return qobject_cast<QMenu*>(w) != nullptr; });
            QVERIFY2(inMenu || places.contains(m_window->ui().mainToolBar) ||
                         (places.contains(m_window.get()) && !a->shortcut().isEmpty()),
                     qPrintable(a->objectName()));
        }
        // Commands not available yet are there but not usable, and say so.
        QAction* notYet = m_window->ui().action(QStringLiteral("actionMangelListe"));
        QVERIFY(!notYet->isEnabled());
        QVERIFY(notYet->toolTip().contains(QStringLiteral("Mängelliste")));
        // "Stammdaten Export" waits for its own function instead of opening another one.
        QVERIFY(!m_window->ui().action(QStringLiteral("actionFileSizeWarning"))->isEnabled());

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

    void standardShortcuts_data()
    {
        QTest::addColumn<QString>("target");
        QTest::addColumn<QKeySequence>("keys");
        // The platform's key where it has one, else the fixed one.
        const auto standard = [](QKeySequence::StandardKey key, const QKeySequence& fallback) {
            return QKeySequence::keyBindings(key).value(0, fallback);
        };
        // clang-format off
        QTest::newRow("new") << "actionFileNew" << standard(QKeySequence::New, QKeySequence("Ctrl+N"));
        QTest::newRow("open") << "actionFileOpen" << standard(QKeySequence::Open, QKeySequence("Ctrl+O"));
        QTest::newRow("save") << "actionFileSave" << standard(QKeySequence::Save, QKeySequence("Ctrl+S"));
        QTest::newRow("save as") << "actionFileSaveAs" << standard(QKeySequence::SaveAs, QKeySequence("Ctrl+Shift+S"));
        QTest::newRow("print") << "actionFilePrintEntries" << standard(QKeySequence::Print, QKeySequence("Ctrl+P"));
        QTest::newRow("quit") << "actionFileExit" << standard(QKeySequence::Quit, QKeySequence("Ctrl+Q"));
        QTest::newRow("help") << "actionHelpShowHelp" << standard(QKeySequence::HelpContents, QKeySequence("F1"));
        QTest::newRow("previous report") << "actionEntryGotoPrevious" << QKeySequence("Ctrl+PgUp");
        QTest::newRow("next report") << "actionEntryGotoNext" << QKeySequence("Ctrl+PgDown");
        QTest::newRow("first report") << "actionEntryGotoFirst" << QKeySequence("Ctrl+Shift+PgUp");
        QTest::newRow("last report") << "actionEntryGotoLast" << QKeySequence("Ctrl+Shift+PgDown");
        QTest::newRow("Alt+D opens Datei") << "menuFile" << QKeySequence("Alt+D");
        QTest::newRow("F10 opens the menu bar") << "menuFile" << QKeySequence("F10");
        // clang-format on
    }

    void standardShortcuts()
    {
        QFETCH(QString, target);
        QFETCH(QKeySequence, keys);
        QVERIFY(m_window->createDocument(true)); // the document commands are enabled
        QVERIFY(activateWindow());
        QAction* action = m_window->ui().action(target);
        if (!action) {
            QTest::keySequence(m_window.get(), keys);
            QTRY_VERIFY(m_window->menuBar()->activeAction());
            QCOMPARE(m_window->menuBar()->activeAction()->menu()->objectName(), target);
            return;
        }
        QCOMPARE(action->shortcut(), keys);
        // Menus show the key beside the command.
        QVERIFY(!action->associatedWidgets().isEmpty());
        // Commands that ask for a file are cancelled.
        m_prompt.expectFileName(QString());
        // The report selection is closed as the user would.
        if (target == QLatin1String("actionFilePrintEntries"))
            clickWhenShown(QStringLiteral("pushButtonCancel"));
        QSignalSpy triggered(action, &QAction::triggered);
        QTest::keySequence(m_window.get(), keys);
        // Commands not available yet are bound already, and wait disabled.
        QCOMPARE(triggered.count(), action->isEnabled() ? 1 : 0);
        if (target == QLatin1String("actionHelpShowHelp"))
            QCOMPARE(m_openedUrls, QList<QUrl>{QUrl::fromLocalFile(VDRMainWindow::helpPagePath())});
    }

    void qtDialogsSpeakTheInterfaceLanguage_data()
    {
        QTest::addColumn<QLocale>("locale");
        QTest::addColumn<QStringList>("buttons");
        QTest::addColumn<QString>("overwrite");
        QTest::newRow("German") << QLocale(QLocale::German, QLocale::Germany)
                                << QStringList{"Ja", "Nein", "Speichern", "Verwerfen", "Abbrechen"}
                                << "Soll sie überschrieben werden?";
        QTest::newRow("Spanish") << QLocale(QLocale::Spanish, QLocale::Spain)
                                 << QStringList{"Sí", "No", "Guardar", "Descartar", "Cancelar"}
                                 << "¿Desea reemplazarlo?";
        QTest::newRow("English") << QLocale(QLocale::English, QLocale::UnitedStates)
                                 << QStringList{"Yes", "No", "Save", "Discard", "Cancel"}
                                 << "Do you want to replace it?";
    }

    void qtDialogsSpeakTheInterfaceLanguage()
    {
        QFETCH(QLocale, locale);
        QFETCH(QStringList, buttons);
        QFETCH(QString, overwrite);
        const QList<QTranslator*> translators = VDRStartup::installTranslators(*qApp, locale);
        QMessageBox box(QMessageBox::Question, QStringLiteral("Frage"), QStringLiteral("Text"),
                        QMessageBox::Yes | QMessageBox::No | QMessageBox::Save | QMessageBox::Discard |
                            QMessageBox::Cancel);
        QStringList texts;
        for (QMessageBox::StandardButton button : {QMessageBox::Yes, QMessageBox::No, QMessageBox::Save,
                                                   QMessageBox::Discard, QMessageBox::Cancel})
            texts << plain(box.button(button)->text());
        const QString question =
            QCoreApplication::translate("QFileDialog", "%1 already exists.\nDo you want to replace it?");
        for (QTranslator* translator : translators)
            QCoreApplication::removeTranslator(translator);
        qDeleteAll(translators);
        QCOMPARE(texts, buttons);
        QVERIFY2(question.contains(overwrite), qPrintable(question));
    }

    void viewTogglesShowCheckMarks()
    {
        const struct
        {
            const char* action;
            QWidget* widget;
        } toggles[] = {{"actionViewToolbar", m_window->ui().mainToolBar},
                       {"actionViewStatusbar", m_window->statusBar()},
                       {"actionViewEntryList", m_window->findChild<QDockWidget*>("dockWidgetEntryList")},
                       {"actionEntrySearchByDate", m_window->findChild<QDockWidget*>("dockWidgetEntryDate")}};
        for (const auto& toggle : toggles) {
            QAction* action = m_window->ui().action(QLatin1String(toggle.action));
            QVERIFY(action->isCheckable());
            const bool shown = toggle.widget->isVisible();
            QCOMPARE(action->isChecked(), shown);
            action->trigger();
            QCOMPARE(toggle.widget->isVisible(), !shown);
            QCOMPARE(action->isChecked(), !shown);
            // Closed another way: the menu shows the truth when it opens.
            toggle.widget->setVisible(shown);
            emit m_window->ui().menu(QStringLiteral("menuView"))->aboutToShow();
            QCOMPARE(action->isChecked(), shown);
        }
    }

    void helpPageAndAboutBox()
    {
        QAction* help = m_window->ui().action(QStringLiteral("actionHelpShowHelp"));
        QAction* about = m_window->ui().action(QStringLiteral("actionHelpInfoDialog"));
        QVERIFY(help->isEnabled() && about->isEnabled());
        QFile page(VDRMainWindow::helpPagePath());
        QVERIFY(page.open(QIODevice::ReadOnly));
        QVERIFY(QString::fromUtf8(page.readAll()).contains(QStringLiteral("Tastatur")));

        const auto box = m_window->createAboutBox();
        QCOMPARE(box->windowTitle(), QStringLiteral("Info über Varduna"));
        for (const QString& part :
             {QStringLiteral("Varduna " VARDUNA_VERSION), QStringLiteral("Qt %1").arg(qVersion()),
              QStringLiteral("LGPL"), QStringLiteral("SQLite 3."), QStringLiteral("Hunspell"),
              QStringLiteral("libexif")})
            QVERIFY2(box->text().contains(part), qPrintable(part));

        const QByteArray screenshot = qgetenv("VARDUNA_SCREENSHOT");
        if (!screenshot.isEmpty()) {
            const QList<QTranslator*> translators =
                VDRStartup::installTranslators(*qApp, QLocale(QLocale::German, QLocale::Germany));
            const auto shown = m_window->createAboutBox();
            shown->show();
            QTest::qWait(100);
            QVERIFY(shown->grab().save(QString::fromLocal8Bit(screenshot)));
            for (QTranslator* translator : translators)
                QCoreApplication::removeTranslator(translator);
            qDeleteAll(translators);
        }
    }

    void reportPageNamesProjectAndFile()
    {
        QVERIFY(m_window->createDocument(true));
        auto* page = m_window->findChild<QLabel*>(QStringLiteral("reportPage"));
        // A new diary starts with one report.
        QVERIFY2(page->text().contains(QStringLiteral("1 Baubericht<")), qPrintable(page->text()));
        QVERIFY(page->text().contains(QStringLiteral("Neues Varduna")));
        QVERIFY(m_window->document()->appendEntry() >= 0);
        QVERIFY(m_window->document()->modelEntryAll()->submitAll());
        const QString path = m_dir.filePath(QStringLiteral("Rohbau Nord.vd2"));
        QFile::remove(path);
        m_prompt.expectFileName(path);
        QCOMPARE(m_window->saveDocument(false, true), 0);
        // After saving under a name, the page names the file beside the project's own name.
        QVERIFY2(page->text().contains(QStringLiteral("2 Bauberichte")), qPrintable(page->text()));
        QVERIFY(page->text().contains(QStringLiteral("Rohbau Nord.vd2")));
        QVERIFY(page->text().contains(QStringLiteral("Projektdaten bearbeiten")));
        QVERIFY(m_window->windowTitle().contains(QStringLiteral("Rohbau Nord.vd2")));
    }

    void geometryFitsTheScreen_data()
    {
        QTest::addColumn<QRect>("wanted");
        QTest::addColumn<QRect>("available");
        QTest::addColumn<QRect>("fitted");
        const QRect laptop(0, 0, 1366, 736);
        // clang-format off
        QTest::newRow("fits already") << QRect(100, 100, 800, 600) << laptop << QRect(100, 100, 800, 600);
        QTest::newRow("default size on a laptop") << QRect(83, -32, 1200, 800) << laptop << QRect(83, 0, 1200, 736);
        QTest::newRow("saved off the right edge") << QRect(1000, 100, 1200, 700) << laptop << QRect(166, 36, 1200, 700);
        QTest::newRow("larger than the screen") << QRect(-50, -50, 3000, 2000) << laptop << laptop;
        QTest::newRow("second screen") << QRect(0, 0, 800, 600) << QRect(1920, 0, 1366, 736) << QRect(1920, 0, 800, 600);
        // clang-format on
    }

    void geometryFitsTheScreen()
    {
        QFETCH(QRect, wanted);
        QFETCH(QRect, available);
        QFETCH(QRect, fitted);
        QCOMPARE(VDRMainWindow::fittedGeometry(wanted, available), fitted);
    }

    void furtherInstanceOpensAside()
    {
        // The offscreen screen is smaller than the default window: the window fits it all the same.
        const QRect screen = m_window->screen()->availableGeometry();
        m_window->restoreWindowGeometry(QByteArray(), QByteArray(), 0);
        QCOMPARE(screen.intersected(m_window->geometry()), m_window->geometry()); // inside the screen
        const QByteArray saved = m_window->saveGeometry();
        m_window->restoreWindowGeometry(saved, QByteArray(), 0);
        const QRect first = m_window->geometry();
        m_window->restoreWindowGeometry(saved, QByteArray(), 1);
        QVERIFY(screen.contains(m_window->geometry()));
        QVERIFY(m_window->geometry().topLeft() != first.topLeft());

        // Instances count from 0; the number of one that ended is free again.
        std::unique_ptr<QLockFile> a, b, c;
        QCOMPARE(VDRStartup::claimInstance(m_dir.path(), a), 0);
        QCOMPARE(VDRStartup::claimInstance(m_dir.path(), b), 1);
        a.reset();
        QCOMPARE(VDRStartup::claimInstance(m_dir.path(), c), 0);
    }

    void documentCommandsFollowTheDocument()
    {
        QAction* save = m_window->ui().action(QStringLiteral("actionFileSave"));
        QVERIFY(!save->isEnabled());
        m_window->ui().action(QStringLiteral("actionFileNew"))->trigger();
        QVERIFY(m_window->document()->isStateNew());
        QVERIFY(save->isEnabled());
        QVERIFY(m_window->closeDocument(false));
        QVERIFY(!save->isEnabled());
        // A failed open from the command leaves a new diary to work in.
        m_prompt.expectFileName(m_dir.filePath(QStringLiteral("gibt es nicht.vd2")));
        m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("existiert nicht."));
        m_window->ui().action(QStringLiteral("actionFileOpen"))->trigger();
        QVERIFY(m_window->document()->isStateNew());
        QVERIFY(save->isEnabled());
    }

    void newDiaryBringsDefaultSuggestionTexts()
    {
        QSettings settings;
        settings.remove(VDRCompleter::settingsGroup());
        m_window->ui().action(QStringLiteral("actionFileNew"))->trigger();
        const QString group = VDRCompleter::settingsGroup();
        QCOMPARE(settings.value(group + QStringLiteral("/Mängel/Raumname/values/size")).toInt(), 6);
        QCOMPARE(settings.value(group + QStringLiteral("/Mängel/Raumbuch-Nr./values/1/centry")).toString(),
                 QStringLiteral("UG-001"));
        // That lists the user changed survive is the suggestion lists' own test.
        QCOMPARE(settings.value(group + QStringLiteral("/Baustoffe/Einheit/values/size")).toInt(), 5);
    }

    void recentFilesHoldOneEntryPerFile()
    {
        const QString a = newDiary(QStringLiteral("a.vd2"));
        const QString b = newDiary(QStringLiteral("b.vd2"));
        QCOMPARE(m_window->openDocument(a, false, true), 0);
        QCOMPARE(m_window->openDocument(b, false, true), 0);
        // The same file again, by a relative path.
        const QString relative = QDir::current().relativeFilePath(a);
        QCOMPARE(m_window->openDocument(relative, false, true), 0);
        QCOMPARE(m_window->recentFiles(),
                 QStringList({QFileInfo(a).absoluteFilePath(), QFileInfo(b).absoluteFilePath()}));
        QCOMPARE(QSettings().value(VDRMainWindow::recentFileListSettingsKey()).toStringList(),
                 m_window->recentFiles());
        QCOMPARE(plain(m_window->ui().menuFileRecent->actions().first()->text()), QStringLiteral("a.vd2"));

        // A recent file that has gone is dropped from the list when it fails to open.
        QVERIFY(m_window->closeDocument(false));
        QVERIFY(QFile::remove(b));
        m_prompt.expect(QStringLiteral("Dateifehler"), QStringLiteral("existiert nicht."));
        m_window->ui().menuFileRecent->actions().at(1)->trigger();
        QCOMPARE(m_window->recentFiles(), QStringList{QFileInfo(a).absoluteFilePath()});
        QVERIFY(m_window->document()->isStateNew()); // a failed open leaves a new diary
    }

    void closingWithUnsavedChanges_data()
    {
        QTest::addColumn<int>("answer");
        QTest::addColumn<bool>("closed");
        QTest::addColumn<QString>("savedName");
        QTest::newRow("cancel keeps window and document")
            << int(VDRPrompt::Cancel) << false << "Neues Varduna";
        QTest::newRow("discard") << int(VDRPrompt::Discard) << true << "Neues Varduna";
        QTest::newRow("save") << int(VDRPrompt::Save) << true << "Geändert";
    }

    void closingWithUnsavedChanges()
    {
        QFETCH(int, answer);
        QFETCH(bool, closed);
        QFETCH(QString, savedName);
        const QString path = newDiary(QStringLiteral("schliessen.vd2"));
        QCOMPARE(m_window->openDocument(path, false, true), 0);
        VDRDocument* doc = m_window->document();
        QVERIFY(renameProject(QStringLiteral("Geändert")));

        m_prompt.expect(QStringLiteral("Dokument geändert"),
                        QStringLiteral("Möchten Sie die Änderungen speichern?"), answer);
        QCOMPARE(m_window->close(), closed);
        QCOMPARE(doc->isStateValid(), !closed);
        if (!closed) {
            QVERIFY(m_window->isVisible());
            QVERIFY(QFile::exists(path + QStringLiteral(".workingcopy")));
            return;
        }
        QCOMPARE(projectNameIn(path), savedName);
        QVERIFY(!QFile::exists(path + QStringLiteral(".workingcopy")));
    }

    void keyPressMarksModified_data()
    {
        QTest::addColumn<QString>("receiver");
        QTest::addColumn<QKeySequence>("keys");
        QTest::addColumn<bool>("modified");
        QTest::newRow("a key that changes nothing") << "window" << QKeySequence(Qt::Key_Right) << true;
        QTest::newRow("a letter") << "window" << QKeySequence(Qt::Key_A) << true;
        // The Ctrl of Ctrl+O or the key of a command is no edit, even while the command is disabled.
        QTest::newRow("a modifier alone") << "window" << QKeySequence(Qt::Key_Control) << false;
        QTest::newRow("key of a disabled command") << "window" << QKeySequence(Qt::CTRL | Qt::Key_P) << false;
        QTest::newRow("in a message box") << "message box" << QKeySequence(Qt::Key_Tab) << false;
        QTest::newRow("in a menu") << "menu" << QKeySequence(Qt::Key_Down) << false;
    }

    void keyPressMarksModified()
    {
        QFETCH(QString, receiver);
        QFETCH(QKeySequence, keys);
        QFETCH(bool, modified);
        QVERIFY(m_window->createDocument(true));
        QVERIFY(!m_window->document()->isStateModified());
        QMessageBox box(QMessageBox::Information, QStringLiteral("Info"), QStringLiteral("Text"));
        QWidget* widget = m_window.get();
        if (receiver == QLatin1String("message box")) {
            box.show();
            widget = &box;
        } else if (receiver == QLatin1String("menu")) {
            widget = m_window->ui().menu(QStringLiteral("menuFile"));
            static_cast<QMenu*>(widget)->popup(QPoint());
        }
        KeyPressEater eater;
        qApp->installEventFilter(&eater);
        QTest::keySequence(widget, keys);
        qApp->removeEventFilter(&eater);
        QCOMPARE(m_window->document()->isStateModified(), modified);
        if (modified)
            m_prompt.expect(QStringLiteral("Dokument geändert"), QString(), VDRPrompt::Discard);
        QVERIFY(m_window->closeDocument(true));
    }

    void exchangeAndFollowUpCommands_data()
    {
        QTest::addColumn<bool>("saveNow");
        QTest::newRow("save now, delete the file") << true;
        QTest::newRow("save later, keep the file") << false;
    }

    // Importing an exchange file from the menu, and copying the master data into a follow-up diary.
    void exchangeAndFollowUpCommands()
    {
        QFETCH(bool, saveNow);
        const QString path = newDiary(QStringLiteral("Haus.vd2"));
        QCOMPARE(m_window->openDocument(path, false, true), 0);
        const QString vdx = m_dir.filePath(QStringLiteral("Haus.2026-03-07T16-05-09.vdx"));
        QFile::remove(vdx);
        {
            VDRExchangeFileBuilder file(vdx, QStringLiteral("Haus.vd2"));
            QVERIFY(file.addReport(QStringLiteral("002"), QDate(2026, 3, 7),
                                   QDateTime(QDate(2026, 3, 7), QTime(7, 0)), {{"locked", 1}}) > 0);
        }
        QAction* import = m_window->ui().action(QStringLiteral("actionExchangeReport_2"));
        QVERIFY(import->isEnabled());
        m_prompt.expectFileName(vdx);
        m_prompt.expect(QStringLiteral("Import einer Austauschdatei"));
        m_prompt.expectTicked(
            QStringLiteral("Ergebnis der Synchronisation"),
            QStringLiteral("\nNach dem Import von Berichten sollte das Varduna gespeichert werden.\n"),
            saveNow ? 0 : 1);
        if (saveNow)
            m_prompt.expect(QStringLiteral("Datenbank bereinigen"), QStringLiteral("wird jetzt bereinigt"));
        import->trigger();
        QCOMPARE(m_window->document()->modelEntryAll()->rowCount(), 2);
        QVERIFY(!QFileInfo::exists(vdx)); // ticked: deleted, after saving when saving now
        QCOMPARE(queryValue(path, QStringLiteral("SELECT count(*) FROM entry")).toInt(), saveNow ? 2 : 1);

        const QString next = m_dir.filePath(QStringLiteral("Haus 2.vd2"));
        QFile::remove(next);
        if (!saveNow)
            m_prompt.expect(QStringLiteral("Stammdaten Export"), QStringLiteral("vor dem Exportieren"),
                            VDRPrompt::Yes);
        m_prompt.expectFileName(next);
        m_window->ui().action(QStringLiteral("actionExportMasterData"))->trigger();
        QCOMPARE(queryTexts(next, QStringLiteral("SELECT number FROM entry")), QStringList{"003 (Entwurf)"});
        QCOMPARE(
            queryValue(path, QStringLiteral("SELECT value FROM meta WHERE key = 'exportedTo'")).toString(),
            next);
    }

    void followUpOfAnOlderDiarySavesItInTheCurrentFormatFirst()
    {
        const QString path = m_dir.filePath(QStringLiteral("Altbau.vd2"));
        QVERIFY(createOldestLayoutDiary(path, QStringLiteral("0.3")));
        m_prompt.expect(QStringLiteral("Datei-Warnung"));
        QCOMPARE(m_window->openDocument(path, false, true), 0);
        const QString next = m_dir.filePath(QStringLiteral("Altbau 2.vd2"));
        QFile::remove(next);
        m_prompt.expect(QStringLiteral("Stammdaten Export"),
                        QStringLiteral("im aktuellen Dateiformat gespeichert"), VDRPrompt::Ok);
        m_prompt.expectFileName(next);
        m_window->ui().action(QStringLiteral("actionExportMasterData"))->trigger();
        QCOMPARE(
            queryValue(path, QStringLiteral("SELECT value FROM meta WHERE key = 'fileversion'")).toString(),
            VDRDatabaseSchema::currentVersion());
        QVERIFY(QFileInfo::exists(next));
    }

    void sessionEndKeepsUnsavedWorkForNextOpening_data()
    {
        QTest::addColumn<bool>("modified");
        QTest::addColumn<bool>("windowDestroyed"); // the program ends without closing the diary
        QTest::newRow("unsaved changes") << true << false;
        QTest::newRow("nothing changed") << false << false;
        QTest::newRow("window destroyed, unsaved changes") << true << true;
        QTest::newRow("window destroyed, nothing changed") << false << true;
    }

    void sessionEndKeepsUnsavedWorkForNextOpening()
    {
        QFETCH(bool, modified);
        QFETCH(bool, windowDestroyed);
        const QString path = newDiary(QStringLiteral("abmelden.vd2"));
        QCOMPARE(m_window->openDocument(path, false, true), 0);
        if (modified)
            QVERIFY(renameProject(QStringLiteral("Nicht gespeichert")));
        if (windowDestroyed) {
            m_window.reset();
            m_window = std::make_unique<VDRMainWindow>();
        } else {
            m_window->endSession();
        }
        QCOMPARE(QFile::exists(path + QStringLiteral(".workingcopy")), modified);
        QCOMPARE(QFile::exists(VDRDocument::lockInfoPathFor(path)), modified);

        VDRDocument::setGlobalModified(false);
        if (modified)
            m_prompt.expect(QStringLiteral("Datei öffnen"),
                            QStringLiteral("nicht ordnungsgemäß abgeschlossen"));
        QCOMPARE(m_window->openDocument(path, false, true), 0);
        QCOMPARE(m_window->document()->projectName(),
                 modified ? QStringLiteral("Nicht gespeichert") : QStringLiteral("Neues Varduna"));
    }

    void terminationSignalEndsCleanly()
    {
        // The real program in a process of its own: while it holds the diary, the command-line tool
        // sees it held; SIGTERM without changes closes it properly.
        const QString path = newDiary(QStringLiteral("signal.vd2"));
        QProcess app;
        QProcessEnvironment env = QProcessEnvironment::systemEnvironment();
        env.insert(QStringLiteral("QT_QPA_PLATFORM"), QStringLiteral("offscreen"));
        env.insert(QStringLiteral("XDG_CONFIG_HOME"), settingsFolder());
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

    void firstDocumentRules_data()
    {
        QTest::addColumn<QString>("desktopFile");
        QTest::addColumn<QString>("reopen");
        QTest::addColumn<QStringList>("arguments");
        QTest::addColumn<QString>("expected");
        const auto row = [](const char* tag, const char* desktopFile, const char* reopen,
                            const QStringList& arguments, const char* expected) {
            QTest::newRow(tag) << QString::fromLatin1(desktopFile) << QString::fromLatin1(reopen) << arguments
                               << QString::fromLatin1(expected);
        };
        row("desktop file first", "finder.vd2", "reopen.vd2", {"arg.vd2"}, "finder.vd2");
        row("re-open key next", "", "reopen.vd2", {"arg.vd2"}, "reopen.vd2");
        row("one argument", "", "", {"arg.vd2"}, "arg.vd2");
        row("-file", "", "", {"-style", "x", "-file", "f.vd2"}, "f.vd2");
        row("first -file wins", "", "", {"-file", "a.vd2", "-file", "b.vd2"}, "a.vd2");
        row("-file without path", "", "", {"-x", "-file"}, "");
        row("nothing", "", "", {}, "");
    }

    void firstDocumentRules()
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
        QCOMPARE(settings.contains(VDRStartup::reopenSettingsKey()),
                 !reopen.isEmpty() && !desktopFile.isEmpty());
        settings.remove(VDRStartup::reopenSettingsKey());
    }

    void firstDocumentOpensOrExplains_data()
    {
        QTest::addColumn<QString>("kind");
        QTest::addColumn<bool>("opened");
        QTest::newRow("diary") << "diary" << true;
        // An exchange file is imported into a new diary and left untouched.
        QTest::newRow("exchange file") << "vdx" << true;
        QTest::newRow("missing exchange file") << "missing vdx" << false;
        QTest::newRow("missing file") << "missing" << false;
    }

    void firstDocumentOpensOrExplains()
    {
        QFETCH(QString, kind);
        QFETCH(bool, opened);
        QString path = m_dir.filePath(QStringLiteral("nicht da.vd2"));
        QByteArray hash;
        if (kind == QLatin1String("diary")) {
            path = newDiary(QStringLiteral("start.vd2"));
        } else if (kind == QLatin1String("vdx")) {
            path = m_dir.filePath(QStringLiteral("vom Handy.vdx"));
            QFile::remove(path);
            {
                VDRExchangeFileBuilder file(path, QStringLiteral("vom Handy.vd2"));
                QVERIFY(file.addReport(QStringLiteral("004"), QDate(2026, 3, 7),
                                       QDateTime(QDate(2026, 3, 7), QTime(7, 0)), {{"locked", 1}}) > 0);
            }
            hash = fileHash(path);
            m_prompt.expect(QStringLiteral("Import einer Austauschdatei"));
            m_prompt.expect(QStringLiteral("Ergebnis der Synchronisation"),
                            QStringLiteral("Bericht 004-AB als Bericht 004-AB"), 1);
        } else {
            if (kind == QLatin1String("missing vdx"))
                path = m_dir.filePath(QStringLiteral("nicht da.vdx"));
            m_prompt.expect(
                QStringLiteral("Dateifehler"),
                QStringLiteral("Die Datei\n%1\nexistiert nicht.").arg(QDir::toNativeSeparators(path)));
        }
        QCOMPARE(VDRStartup::openFirstDocument(*m_window, path), opened);
        QCOMPARE(m_window->document()->isStateValid(), opened);
        if (kind == QLatin1String("vdx")) {
            QSqlQuery q(m_window->document()->database());
            QVERIFY(q.exec(QStringLiteral("SELECT count(*) FROM entry WHERE number = '004'")) && q.next());
            QCOMPARE(q.value(0).toInt(), 1);
        }
        if (!hash.isEmpty()) {
            QCOMPARE(fileHash(path), hash);
            QCOMPARE(QDir(m_dir.path()).entryList({QStringLiteral("vom Handy*")}, QDir::Files),
                     QStringList{QStringLiteral("vom Handy.vdx")});
        }
        // The window stays usable: a new diary can be created.
        QVERIFY(m_window->ui().action(QStringLiteral("actionFileNew"))->isEnabled());
    }

    void restartCommand_data()
    {
        QTest::addColumn<QStringList>("arguments");
        QTest::addColumn<QStringList>("rest");
        // clang-format off
        QTest::newRow("no arguments") << QStringList{"varduna"} << QStringList();
        QTest::newRow("a diary") << QStringList{"./varduna", "/home/a/Bau.vd2"} << QStringList{"/home/a/Bau.vd2"};
        QTest::newRow("-file") << QStringList{"/opt/varduna", "-file", "x.vd2"} << QStringList{"-file", "x.vd2"};
        // clang-format on
    }

    void restartCommand()
    {
        QFETCH(QStringList, arguments);
        QFETCH(QStringList, rest);
        // The program is always this executable, never the diary it was started with.
        const auto command = VDRStartup::restartCommand(arguments, QStringLiteral("/opt/self"));
        QCOMPARE(command.first, QStringLiteral("/opt/self"));
        QCOMPARE(command.second, rest);
    }

    void demoProjectNeverOffersARefusedSave_data()
    {
        QTest::addColumn<bool>("edited");
        QTest::addColumn<int>("answer");
        QTest::addColumn<bool>("closed");
        QTest::newRow("unchanged closes without a question") << false << -1 << true;
        QTest::newRow("edited, cancel keeps it") << true << 1 << false;
        QTest::newRow("edited, discard closes") << true << 0 << true;
    }

    void demoProjectNeverOffersARefusedSave()
    {
        QFETCH(bool, edited);
        QFETCH(int, answer);
        QFETCH(bool, closed);
        if (!QFile::exists(VDRMainWindow::demoProjectPath()))
            QSKIP("the demo project is generated by the build");
        m_window->ui().action(QStringLiteral("actionOpenDemoProject"))->trigger();
        QVERIFY(m_window->document()->isDemoProject());
        QVERIFY(m_window->recentFiles().isEmpty()); // not a recent file
        QVERIFY(m_window->windowTitle().contains(QStringLiteral("Musterprojekt")));
        // Saving is not offered, and the reason is at hand.
        for (const char* command : {"actionFileSave", "actionFileSaveAs"}) {
            QAction* action = m_window->ui().action(QLatin1String(command));
            QVERIFY(!action->isEnabled());
            QCOMPARE(action->toolTip(), QStringLiteral("Das Musterprojekt kann nicht gespeichert werden."));
        }
        // The save key does nothing: no refusal, and no mark that would ask on closing.
        KeyPressEater eater;
        qApp->installEventFilter(&eater);
        QVERIFY(activateWindow());
        QTest::keySequence(m_window.get(), QKeySequence::Save);
        qApp->removeEventFilter(&eater);
        QVERIFY(!m_window->document()->isStateModified());
        m_prompt.expect(QStringLiteral("Datenbank bereinigen"),
                        QStringLiteral("für das Musterprojekt nicht möglich"));
        m_window->ui().action(QStringLiteral("actionCompactDB"))->trigger();

        if (edited) {
            VDRDocument::setGlobalModified(true);
            m_prompt.expect(QStringLiteral("Dokument geändert"), QStringLiteral("nicht gespeichert werden"),
                            answer);
        }
        QCOMPARE(m_window->close(), closed);
        QCOMPARE(m_window->document()->isStateValid(), !closed);
        if (edited)
            QCOMPARE(m_prompt.messages.last().buttons, QStringList({"Verwerfen", "Abbrechen"}));
    }

    void printCommands_data()
    {
        QTest::addColumn<QString>("command");
        QTest::addColumn<int>("diary"); // 0 none, 1 without reports, 2 with the draft 012 by AB
        QTest::addColumn<QString>("outcome");
        QTest::addColumn<QString>("proposal"); // the PDF name the save dialog proposes
        // clang-format off
        QTest::newRow("preview, no diary") << "on_actionFilePreviewEntry_triggered" << 0 << "" << "";
        QTest::newRow("print, no diary") << "on_actionFilePrintEntries_triggered" << 0 << "" << "";
        QTest::newRow("preview, no report") << "on_actionFilePreviewEntry_triggered" << 1 << "warning" << "";
        QTest::newRow("pdf, no report") << "on_actionFilePDFCurEntry_triggered" << 1 << "warning" << "";
        QTest::newRow("printer") << "on_actionFilePrintCurEntry_triggered" << 2 << "viewer" << "";
        QTest::newRow("preview") << "on_actionFilePreviewEntry_triggered" << 2 << "preview" << "";
        QTest::newRow("pdf") << "on_actionFilePDFCurEntry_triggered" << 2 << "pdf" << "Projekt - Bericht 012-AB (Entwurf).pdf";
        QTest::newRow("list row, pdf") << "slot_dockWidgetEntryList_doEntryAllPdf" << 2 << "pdf" << "Projekt - Bericht 012-AB (Entwurf).pdf";
        QTest::newRow("list row, printer") << "slot_dockWidgetEntryList_doEntryAllPrint" << 2 << "viewer" << "";
        QTest::newRow("chosen reports, pdf") << "on_actionFilePrintEntries_triggered" << 2 << "pdf" << "Projekt - Bericht 012.pdf";
        // clang-format on
    }

    // The report commands: nothing without a diary, a note without a report, else the report's way out.
    void printCommands()
    {
        QFETCH(QString, command);
        QFETCH(int, diary);
        QFETCH(QString, outcome);
        QFETCH(QString, proposal);
        QStringList opened, previewed;
        VDRPrintHooks::setOpenFile([&](const QString& path) { opened << path; });
        VDRPrintHooks::setPreview([&](const QStringList& files) { previewed = files; });
        const auto hooks = qScopeGuard([] {
            VDRPrintHooks::setOpenFile(nullptr);
            VDRPrintHooks::setPreview(nullptr);
        });
        QSettings().remove(QStringLiteral("PDFExport"));
        const QString folder = m_dir.filePath(QStringLiteral("Druck"));
        QVERIFY(QDir().mkpath(folder));
        if (diary > 0) {
            const QString path = folder + QStringLiteral("/Projekt.vd2");
            QFile::remove(path);
            QVERIFY(createDiary(path));
            QVERIFY(execSql(path,
                            {"UPDATE vdr SET name = 'Projekt'",
                             diary == 1
                                 ? "DELETE FROM entry"
                                 : "UPDATE entry SET number = '012 (Entwurf)', user_id = 'AB', locked = 0"}));
            QCOMPARE(m_window->openDocument(path, false, true), 0);
        }
        QCOMPARE(m_window->ui().action(QStringLiteral("actionFilePDFCurEntry"))->isEnabled(), diary > 0);
        const QString pdf = folder + QStringLiteral("/gewählt.pdf");
        QFile::remove(pdf);
        if (outcome == QLatin1String("warning"))
            m_prompt.expect(QStringLiteral("Hinweis"),
                            QStringLiteral("Sie haben keinen Bautagesbericht ausgewählt!"));
        if (outcome == QLatin1String("pdf")) {
            m_prompt.expectFileName(pdf);
            // Typed but not yet stored: the printout must see it all the same.
            auto* weather = m_window->findChild<QLineEdit*>(QStringLiteral("entrydataEnvWeather1"));
            weather->setFocus();
            QTest::keyClicks(weather, QStringLiteral("heiter"));
        }
        if (command == QLatin1String("on_actionFilePrintEntries_triggered") && diary > 0)
            clickWhenShown(QStringLiteral("pushButtonPdf"));
        if (command.startsWith(QLatin1String("slot_")))
            QVERIFY(QMetaObject::invokeMethod(m_window.get(), command.toLatin1().constData(), Q_ARG(int, 0)));
        else
            QVERIFY(QMetaObject::invokeMethod(m_window.get(), command.toLatin1().constData()));

        const QString temporary = m_window->document()->temporaryFolder();
        if (outcome == QLatin1String("pdf")) {
            QCOMPARE(m_prompt.fileProposals, QStringList{QDir::toNativeSeparators(folder + "/" + proposal)});
            const QString text = pdfText(pdf);
            QVERIFY(text.contains(QStringLiteral("Baubericht-Nr.: 012-AB")) && text.contains("heiter"));
            QCOMPARE(opened, QStringList{pdf});
        } else if (outcome == QLatin1String("viewer")) {
            QTRY_COMPARE(opened, QStringList{temporary + QStringLiteral("/Varduna.pdf")});
            QVERIFY(pdfText(opened.first()).contains(QStringLiteral("Baubericht-Nr.: 012-AB")));
        } else if (outcome == QLatin1String("preview")) {
            QCOMPARE(previewed.size(), 1);
            QCOMPARE(QFileInfo(previewed.first()).absolutePath(), temporary);
        } else {
            QVERIFY(opened.isEmpty() && previewed.isEmpty());
        }
    }

private:
    // An unsaved change to the open diary, as an edit in the window makes it.
    bool renameProject(const QString& name)
    {
        const bool renamed = setProjectName(*m_window->document(), name);
        VDRDocument::setGlobalModified(renamed);
        return renamed;
    }
    // Clicks a button of the report selection once it shows, modally.
    void clickWhenShown(const QString& button, int tries = 10000)
    {
        QTimer::singleShot(0, this, [this, button, tries] {
            auto* selector = qobject_cast<VDREntrySelectorWidget*>(QApplication::activeModalWidget());
            if (selector)
                selector->findChild<QPushButton*>(button)->click();
            else if (tries > 0)
                clickWhenShown(button, tries - 1);
        });
    }
    // Shortcuts work in the active window only.
    bool activateWindow()
    {
        QApplication::setActiveWindow(m_window.get());
        return QTest::qWaitForWindowActive(m_window.get());
    }
    std::unique_ptr<VDRMainWindow> m_window;
    QList<QUrl> m_openedUrls;
};

QTEST_MAIN(TestVDRMainWindow)
#include "tst_vdrmainwindow.moc"
