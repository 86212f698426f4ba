#include "app/VDRMainWindow.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRFileSizeDialog.h"
#include "document/VDRPrompt.h"
#include "editing/CompleterEditor.h"
#include "editing/VDRBackupConfigDialog.h"
#include "editing/VDRCompleter.h"
#include "editing/VDRFileSizeConfigDialog.h"
#include "editing/VDRSpellChecker.h"

#include <QAction>
#include <QCalendarWidget>
#include <QCloseEvent>
#include <QCoreApplication>
#include <QDir>
#include <QDockWidget>
#include <QFileInfo>
#include <QHeaderView>
#include <QLabel>
#include <QMenu>
#include <QSettings>
#include <QSqlRecord>
#include <QStackedWidget>
#include <QStatusBar>
#include <QTableView>
#include <QTextCharFormat>
#include <QTimer>
#include <QToolBar>

VDRMainWindow* g_mainWindow = nullptr;

namespace {
// Actions whose commands are wired here; every other action waits for its feature.
const char* const kWiredActions[] = {
    "actionFileNew",         "actionFileOpen",           "actionFileSave",        "actionFileSaveAs",
    "actionOpenDemoProject", "actionFileExit",           "actionViewToolbar",     "actionViewStatusbar",
    "actionViewEntryList",   "actionEntrySearchByDate",  "actionNumberOfBackups", "actionFileSizeWarning",
    "actionCompactDB",       "actionStartSpellChecking", "actionVorschlagtexte"};
// Commands that need an open document.
const char* const kDocumentActions[] = {"actionFileSave", "actionFileSaveAs", "actionCompactDB"};
} // namespace

VDRMainWindow::VDRMainWindow(QWidget* parent)
    : QMainWindow(parent), m_document(new VDRDocument(this)), m_central(new QStackedWidget(this)),
      m_welcome(new QLabel(this)), m_reportPage(new QLabel(this)), m_entryList(new QTableView(this)),
      m_calendar(new QCalendarWidget(this)), m_clock(new QLabel(this)), m_clockTimer(new QTimer(this))
{
    setObjectName(QStringLiteral("VDRMainWindow"));
    setWindowTitle(tr("Varduna"));
    m_ui.setupUi(this);

    m_welcome->setObjectName(QStringLiteral("welcomePage"));
    m_welcome->setAlignment(Qt::AlignCenter);
    m_welcome->setWordWrap(true);
    m_welcome->setText(
        tr("<h2>Willkommen bei Varduna</h2><p>Legen Sie mit <b>Datei - Neu</b> ein neues "
           "Bautagebuch an, öffnen Sie mit <b>Datei - Öffnen</b> ein vorhandenes oder sehen Sie sich "
           "mit <b>Datei - Musterprojekt öffnen</b> ein Beispiel an.</p>"));
    m_reportPage->setObjectName(QStringLiteral("reportPage"));
    m_reportPage->setAlignment(Qt::AlignCenter);
    m_central->addWidget(m_welcome);
    m_central->addWidget(m_reportPage);
    setCentralWidget(m_central);

    m_entryList->setObjectName(QStringLiteral("entryList"));
    m_entryList->setEditTriggers(QAbstractItemView::NoEditTriggers);
    m_entryList->setSelectionBehavior(QAbstractItemView::SelectRows);
    m_entryList->verticalHeader()->hide();
    m_dockEntryList = addDock(tr("Bautagesberichte"), QStringLiteral("dockWidgetEntryList"), m_entryList,
                              Qt::LeftDockWidgetArea);
    m_dockEntryDate = addDock(tr("Bauberichts-Kalender"), QStringLiteral("dockWidgetEntryDate"), m_calendar,
                              Qt::LeftDockWidgetArea);
    const char* const photoDocks[][2] = {{QT_TR_NOOP("Bilder Leistungsstand"), "dockWidgetPhotos1"},
                                         {QT_TR_NOOP("Bilder Mängel"), "dockWidgetPhotos2"},
                                         {QT_TR_NOOP("Bilder Behinderungen"), "dockWidgetPhotos3"},
                                         {QT_TR_NOOP("Bilder Wichtige Baumaßnahmen"), "dockWidgetPhotos4"},
                                         {QT_TR_NOOP("Bilder Baustoffe"), "dockWidgetPhotos5"}};
    QDockWidget* firstPhotoDock = nullptr;
    for (const auto& dock : photoDocks) {
        QDockWidget* d =
            addDock(tr(dock[0]), QLatin1String(dock[1]), new QWidget(this), Qt::RightDockWidgetArea);
        if (firstPhotoDock)
            tabifyDockWidget(firstPhotoDock, d);
        else
            firstPhotoDock = d;
    }
    tabifyDockWidget(firstPhotoDock, addDock(tr("Druck-Ansicht"), QStringLiteral("dockWidgetPreview"),
                                             new QWidget(this), Qt::RightDockWidgetArea));
    firstPhotoDock->raise();
    QDockWidget* search = addDock(tr("Volltextsuche"), QStringLiteral("dockWidgetSearch"), new QWidget(this),
                                  Qt::BottomDockWidgetArea);
    resizeDocks({m_dockEntryList, firstPhotoDock}, {320, 320}, Qt::Horizontal);
    resizeDocks({search}, {120}, Qt::Vertical);

    QSettings settings;
    m_dockEntryList->setVisible(settings.value(showEntryListSettingsKey(), true).toBool());
    m_dockEntryDate->setVisible(settings.value(showEntryDateSettingsKey(), true).toBool());

    m_clock->setObjectName(QStringLiteral("statusClock"));
    statusBar()->addPermanentWidget(m_clock);
    connect(m_clockTimer, &QTimer::timeout, this, &VDRMainWindow::updateStatusBar);
    m_clockTimer->start(1000);
    updateStatusBar();

    m_recentFiles = settings.value(recentFileListSettingsKey()).toStringList();
    updateGuiRecentFileList();

    connect(m_document, &VDRDocument::documentOpened, this, &VDRMainWindow::slotDocumentOpened);
    connect(m_document, &VDRDocument::documentClosed, this, &VDRMainWindow::slotDocumentClosed);
    connect(m_document, &VDRDocument::recentFileMissing, this, &VDRMainWindow::removeRecentFile);
    connectActions();
    updateGui();
    resize(1200, 800);
}

VDRMainWindow::~VDRMainWindow()
{
    if (g_mainWindow == this)
        g_mainWindow = nullptr;
}

QDockWidget* VDRMainWindow::addDock(const QString& title, const QString& objectName, QWidget* content,
                                    Qt::DockWidgetArea area)
{
    auto* dock = new QDockWidget(title, this);
    dock->setObjectName(objectName);
    dock->setWidget(content);
    addDockWidget(area, dock);
    return dock;
}

void VDRMainWindow::connectActions()
{
    for (QAction* action : m_ui.allActions()) {
        bool wired = false;
        for (const char* name : kWiredActions)
            wired |= action->objectName() == QLatin1String(name);
        if (!wired) {
            action->setEnabled(false);
            action->setToolTip(tr("%1 (noch nicht verfügbar)").arg(action->text()));
        }
    }
    // Automatic connection by name (on_action..._triggered) needs the actions as children: they are.
    QMetaObject::connectSlotsByName(this);
    connect(m_ui.action(QStringLiteral("actionViewEntryList")), &QAction::triggered, this, [this] {
        m_dockEntryList->setVisible(!m_dockEntryList->isVisible());
        QSettings().setValue(showEntryListSettingsKey(), m_dockEntryList->isVisible());
    });
    connect(m_ui.action(QStringLiteral("actionEntrySearchByDate")), &QAction::triggered, this, [this] {
        m_dockEntryDate->setVisible(!m_dockEntryDate->isVisible());
        QSettings().setValue(showEntryDateSettingsKey(), m_dockEntryDate->isVisible());
    });
}

QString VDRMainWindow::demoProjectPath()
{
    return QDir(QCoreApplication::applicationDirPath() + QStringLiteral("/../Projects"))
        .absoluteFilePath(QStringLiteral("Ejemplo.vd2"));
}

int VDRMainWindow::openDocument(const QString& path, bool noRecentEntry, bool noSaveQuestion)
{
    QString file = path;
    if (file.isEmpty()) {
        file = VDRPrompt::instance()->openFileName(tr("Dokument öffnen"), QString(), tr("Varduna (*.vd2)"));
        if (file.isEmpty())
            return 2;
    }
    if (!noSaveQuestion) {
        const int saved = saveDocument(false, false);
        if (saved != 0)
            return saved == 1 ? 2 : saved;
    }
    if (!closeDocument(false))
        return 2;
    bool showError = true;
    if (!m_document->openDocument(file, showError)) {
        if (showError)
            VDRPrompt::critical(tr("Fehler"),
                                tr("Beim Öffnen des gewählten Dokuments ist ein Fehler aufgetreten!"));
        updateGui();
        return 2;
    }
    syncCompleterTexts();
    updateGui();
    if (!noRecentEntry)
        addRecentFile(file);
    checkFileSize();
    return 0;
}

bool VDRMainWindow::createDocument(bool hideSyncButton)
{
    if (saveDocument(false, false) != 0)
        return false;
    if (!closeDocument(false))
        return false;
    if (!m_document->createDocument(hideSyncButton)) {
        VDRPrompt::critical(tr("Fehler"),
                            tr("Beim Erstellen eines neuen Dokuments ist ein Fehler aufgetreten!"));
        updateGui();
        return false;
    }
    CompleterEditor::writeNewDocumentDefaults();
    updateGui();
    return true;
}

int VDRMainWindow::saveDocument(bool saveAs, bool withoutQuestion)
{
    if (!m_document->isStateValid())
        return 0;
    const QString file = m_document->getFilepath();
    const bool readOnly = !file.isEmpty() && QFileInfo::exists(file) && !QFileInfo(file).isWritable();
    if (!saveAs && readOnly && withoutQuestion) {
        const int choice =
            VDRPrompt::instance()->choose(VDRPrompt::Question, tr("Dokument speichern"),
                                          tr("Das Dokument kann nicht gespeichert werden, da die "
                                             "Datei\n%1\nschreibgeschützt ist.\n\nMöchten Sie "
                                             "die Änderungen in einer neuen Datei speichern?")
                                              .arg(QDir::toNativeSeparators(file)),
                                          {tr("Speichern unter"), tr("Abbrechen")}, 0, 1);
        if (choice != 0)
            return 1;
        saveAs = true;
    }
    const bool modified = withoutQuestion || m_document->isStateModified();
    if (!modified)
        return 0;
    if (!withoutQuestion) {
        if (!readOnly) {
            const VDRPrompt::StandardButton answer = VDRPrompt::instance()->question(
                VDRPrompt::Question, tr("Dokument geändert"),
                tr("Das Dokument wurde geändert. Möchten Sie die Änderungen speichern?"),
                VDRPrompt::Save | VDRPrompt::Discard | VDRPrompt::Cancel, VDRPrompt::Save, VDRPrompt::Cancel);
            if (answer == VDRPrompt::Cancel)
                return 1;
            if (answer == VDRPrompt::Discard) {
                m_document->setMasterDataModified(false);
                return 0;
            }
        } else {
            const int choice = VDRPrompt::instance()->choose(
                VDRPrompt::Question, tr("Dokument geändert"),
                tr("Das Dokument wurde geändert.\nDie Datei \n%1\nist jedoch schreibgeschützt.\n\nMöchten "
                   "Sie die "
                   "Änderungen in einer neuen Datei speichern?")
                    .arg(QDir::toNativeSeparators(file)),
                {tr("Speichern unter"), tr("Verwerfen"), tr("Abbrechen")}, 0, 2);
            if (choice == 2)
                return 1;
            if (choice == 1) {
                m_document->setMasterDataModified(false);
                return 0;
            }
        }
    }
    QString target;
    if (saveAs || m_document->isStateNew() || readOnly) {
        target = VDRPrompt::instance()->saveFileName(tr("Datei speichern"), QFileInfo(file).path(),
                                                     tr("Varduna (*.vd2)"));
        if (target.isEmpty())
            return 1;
        if (QFileInfo(target).suffix().isEmpty())
            target += QStringLiteral(".vd2");
    }
    const int shown = VDRPrompt::messagesShown();
    const int result = m_document->saveDocument(target);
    if (result == 2 && VDRPrompt::messagesShown() == shown)
        VDRPrompt::critical(tr("Fehler"), tr("Beim Speichern des Dokuments ist ein Fehler aufgetreten!"));
    // A failed or refused save must stop whatever wanted to close the document.
    if (result != 0)
        return 1;
    if (!target.isEmpty())
        addRecentFile(target);
    syncCompleterTexts();
    updateGui();
    return 0;
}

bool VDRMainWindow::closeDocument(bool askToSave)
{
    if (!m_document->isStateValid())
        return true;
    if (askToSave && saveDocument(false, false) != 0)
        return false;
    if (!m_document->closeDocument()) {
        VDRPrompt::critical(tr("Fehler"), tr("Beim Schließen des Dokuments ist ein Fehler aufgetreten!"));
        updateGui();
        return false;
    }
    VDRDocument::setGlobalModified(false);
    updateGui();
    return true;
}

void VDRMainWindow::endSession()
{
    if (m_document->isStateValid()) {
        if (m_document->isStateModified())
            m_document->closeKeepingWorkingCopy();
        else
            m_document->closeDocument();
    }
    QSettings settings;
    settings.setValue(geometrySettingsKey(), saveGeometry());
    settings.setValue(windowStateSettingsKey(), saveState());
}

void VDRMainWindow::addRecentFile(const QString& path)
{
    const QString absolute = QFileInfo(path).absoluteFilePath();
    m_recentFiles.removeAll(absolute);
    m_recentFiles.prepend(absolute);
    QSettings().setValue(recentFileListSettingsKey(), m_recentFiles);
    updateGuiRecentFileList();
}

void VDRMainWindow::removeRecentFile(const QString& path)
{
    m_recentFiles.removeAll(QFileInfo(path).absoluteFilePath());
    QSettings().setValue(recentFileListSettingsKey(), m_recentFiles);
    updateGuiRecentFileList();
}

void VDRMainWindow::updateGuiRecentFileList()
{
    QMenu* menu = m_ui.menuFileRecent;
    menu->clear();
    const QIcon icon(QStringLiteral(":/VDRMainWindow/Resources/1 Datei/03-datei-recent.ico"));
    for (const QString& path : qAsConst(m_recentFiles)) {
        QAction* entry = menu->addAction(icon, QFileInfo(path).fileName());
        entry->setData(path);
        entry->setToolTip(QDir::toNativeSeparators(path));
        connect(entry, &QAction::triggered, this, [this, path] {
            if (openDocument(path, true, false) == 2 && !m_document->isStateValid())
                createDocument(true);
        });
    }
    menu->setEnabled(!m_recentFiles.isEmpty());
}

void VDRMainWindow::updateGui()
{
    const bool valid = m_document->isStateValid();
    for (const char* name : kDocumentActions)
        m_ui.action(QLatin1String(name))->setEnabled(valid);
    m_central->setCurrentWidget(valid ? static_cast<QWidget*>(m_reportPage) : m_welcome);
    QString title = tr("Varduna");
    if (valid) {
        const QString name =
            m_document->isStateNew() ? tr("Neues Dokument") : QFileInfo(m_document->getFilepath()).fileName();
        title = tr("Varduna - %1").arg(name);
        if (m_document->isDemoProject())
            title += tr(" (Musterprojekt)");
    }
    setWindowTitle(title);
}

void VDRMainWindow::updateStatusBar()
{
    m_clock->setText(QLocale().toString(QDateTime::currentDateTime(), QLocale::ShortFormat));
}

void VDRMainWindow::showWelcomePage()
{
    if (!m_document->isStateValid())
        m_central->setCurrentWidget(m_welcome);
}

void VDRMainWindow::slotDocumentOpened(VDRDocument* document)
{
    VDRAllEntryTableModel* model = document->modelEntryAll();
    m_entryList->setModel(model);
    const QSqlRecord record = model->record();
    for (int c = 0; c < record.count(); ++c) {
        const QString field = record.fieldName(c);
        m_entryList->setColumnHidden(c, field != QLatin1String("number") &&
                                            field != QLatin1String("inspection_date"));
    }
    model->setHeaderData(QStringLiteral("number"), Qt::Horizontal, tr("Nr."));
    model->setHeaderData(QStringLiteral("inspection_date"), Qt::Horizontal, tr("Datum"));
    m_entryList->resizeColumnsToContents();
    m_entryList->horizontalHeader()->setStretchLastSection(true);
    connect(model, &VDRAllEntryTableModel::reportDatesChanged, this, &VDRMainWindow::slotReportDatesChanged,
            Qt::UniqueConnection);
    model->updateDates();
    m_reportPage->setText(tr("<h2>%1</h2><p>%2 Bauberichte</p>")
                              .arg(document->projectName().toHtmlEscaped())
                              .arg(model->rowCount()));
    updateGui();
}

void VDRMainWindow::slotDocumentClosed(VDRDocument*)
{
    m_entryList->setModel(nullptr);
    m_calendar->setDateTextFormat(QDate(), QTextCharFormat());
    updateGui();
}

void VDRMainWindow::slotReportDatesChanged(const QList<QDate>& dates)
{
    m_calendar->setDateTextFormat(QDate(), QTextCharFormat());
    QTextCharFormat marked;
    marked.setFontWeight(QFont::Bold);
    marked.setBackground(QColor(255, 230, 150));
    for (const QDate& date : dates)
        m_calendar->setDateTextFormat(date, marked);
}

void VDRMainWindow::checkFileSize()
{
    VDRFileSizeDialog dialog(m_document);
    dialog.exec();
}

void VDRMainWindow::closeEvent(QCloseEvent* event)
{
    if (!closeDocument(true)) {
        event->ignore();
        return;
    }
    syncCompleterTexts();
    QSettings settings;
    settings.setValue(geometrySettingsKey(), saveGeometry());
    settings.setValue(windowStateSettingsKey(), saveState());
    event->accept();
}

void VDRMainWindow::on_actionFileNew_triggered()
{
    createDocument(true);
}

void VDRMainWindow::on_actionFileOpen_triggered()
{
    if (openDocument(QString(), false, false) == 2 && !m_document->isStateValid())
        createDocument(true);
}

void VDRMainWindow::on_actionFileSave_triggered()
{
    saveDocument(false, true);
}

void VDRMainWindow::on_actionFileSaveAs_triggered()
{
    if (m_document->isDemoProject()) {
        VDRPrompt::information(tr("Speichern"), tr("Das Musterprojekt kann nicht gespeichert werden."));
        return;
    }
    saveDocument(true, true);
}

void VDRMainWindow::on_actionOpenDemoProject_triggered()
{
    openDocument(demoProjectPath(), true, false);
}

void VDRMainWindow::on_actionFileExit_triggered()
{
    close();
}

void VDRMainWindow::on_actionViewToolbar_triggered()
{
    m_ui.mainToolBar->setVisible(!m_ui.mainToolBar->isVisible());
}

void VDRMainWindow::on_actionViewStatusbar_triggered()
{
    statusBar()->setVisible(!statusBar()->isVisible());
}

void VDRMainWindow::on_actionNumberOfBackups_triggered()
{
    VDRBackupConfigDialog dialog(this);
    dialog.exec();
}

void VDRMainWindow::on_actionFileSizeWarning_triggered()
{
    VDRFileSizeConfigDialog dialog(this);
    dialog.exec();
}

void VDRMainWindow::setSpellChecker(VDRSpellChecker* checker)
{
    m_spellChecker = checker;
    QAction* action = m_ui.action(QStringLiteral("actionStartSpellChecking"));
    action->setEnabled(checker && checker->isValid());
    action->setText(checker && checker->isActive() ? tr("Rechtschreibprüfung aus")
                                                   : tr("Rechtschreibprüfung ein"));
}

void VDRMainWindow::on_actionStartSpellChecking_triggered()
{
    if (!m_spellChecker)
        return;
    m_spellChecker->setActive(!m_spellChecker->isActive());
    setSpellChecker(m_spellChecker);
}

void VDRMainWindow::syncCompleterTexts()
{
    VDRCompleter::writeAll();
}

void VDRMainWindow::on_actionVorschlagtexte_triggered()
{
    CompleterEditor::editCompleters(this);
}

void VDRMainWindow::on_actionCompactDB_triggered()
{
    const QString title = tr("Datenbank bereinigen");
    if (m_document->isDemoProject()) {
        VDRPrompt::information(title,
                               tr("Eine Bereinigung der Datenbank ist für das Musterprojekt nicht möglich."));
        return;
    }
    QString text =
        tr(" Verringern der Datenbankgröße durch Bereinigung der Datenbank\n\nBestimmte Datenbankvorgänge, "
           "wie z.B. das Löschen von Daten, führen zur Fragmentierung der Datenbank-Datei.\nDurch das "
           "Bereinigen der Datenbank werden die Tabellendaten zusammenhängend angeordnet und die "
           "Datenbankdatei-Struktur wird neu organisiert.\nDieser Vorgang kann, insbesondere nach dem "
           "Löschen von Fotos, zu einer z.T. erheblichen Reduzierung der Dateigröße führen.\n");
    QString confirm = tr("Datenbank bereinigen");
    if (m_document->isStateModified()) {
        text += tr("Das Dokument wurde geändert.\nVor dem Bereinigen der Datenbank werden die Änderungen "
                   "gespeichert.\n");
        confirm = tr("Speichern und Bereinigen der Datenbank");
    }
    if (VDRPrompt::instance()->choose(VDRPrompt::Question, title, text, {confirm, tr("Abbrechen")}, 0, 1) !=
        0)
        return;
    // A new diary has no file to compact into yet: it is saved under a name first.
    if (m_document->isStateNew() && saveDocument(true, true) != 0)
        return;
    m_document->compactDB(true);
    updateGui();
}
