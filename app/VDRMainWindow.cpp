#include "app/VDRMainWindow.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRFileSizeDialog.h"
#include "document/VDRPrompt.h"
#include "document/VDRScopedConnection.h"
#include "editing/completion/CompleterEditor.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRSpellChecker.h"
#include "editing/form/VDREntryWidget.h"
#include "editing/masterdata/VDRProjectDataWidget.h"
#include "editing/masterdata/VDRProjectLogoWidget.h"
#include "editing/reportlist/VDREntryDateWidget.h"
#include "editing/reportlist/VDREntryListWidget.h"
#include "editing/settings/VDRBackupConfigDialog.h"
#include "editing/tables/VDRItemDelegate.h"
#include "sync/VDRReportSynchronisation.h"

#include <QAction>
#include <QCloseEvent>
#include <QCoreApplication>
#include <QDesktopServices>
#include <QDir>
#include <QDockWidget>
#include <QFileInfo>
#include <QGuiApplication>
#include <QIconEngine>
#include <QLabel>
#include <QMenu>
#include <QMenuBar>
#include <QMessageBox>
#include <QMetaMethod>
#include <QPainter>
#include <QScreen>
#include <QSettings>
#include <QShortcut>
#include <QSqlQuery>
#include <QStackedWidget>
#include <QStatusBar>
#include <QTimer>
#include <QToolBar>
#include <QUrl>

VDRMainWindow* g_mainWindow = nullptr;

namespace {
// Actions whose commands are wired here; every other action waits for its feature.
const char* const kWiredActions[] = {"actionFileNew",
                                     "actionFileOpen",
                                     "actionFileSave",
                                     "actionFileSaveAs",
                                     "actionOpenDemoProject",
                                     "actionFileExit",
                                     "actionViewToolbar",
                                     "actionViewStatusbar",
                                     "actionViewEntryList",
                                     "actionEntrySearchByDate",
                                     "actionNumberOfBackups",
                                     "actionCompactDB",
                                     "actionStartSpellChecking",
                                     "actionVorschlagtexte",
                                     "actionHelpShowHelp",
                                     "actionHelpInfoDialog",
                                     "actionSettingsProjectData",
                                     "actionSettingsCompanyList",
                                     "actionFormatCompany",
                                     "actionSettingsProjectLogo",
                                     "actionExchangeReport",
                                     "actionExchangeReport_2",
                                     "actionExportMasterData",
                                     "actionFilePrintEmptyEntry",
                                     "actionFilePrintCompanyList",
                                     "actionToolbarPrintCompanyList",
                                     "actionPrintoutSettings",
                                     "actionSchriftarten",
                                     "actionDrucktexte",
                                     "actionEntryNew",
                                     "actionEntryInsert",
                                     "actionEntryCopy",
                                     "actionEntryDelete",
                                     "actionEntryGotoFirst",
                                     "actionEntryGotoPrevious",
                                     "actionEntryGotoNext",
                                     "actionEntryGotoLast",
                                     "actionEntryAlterNumber",
                                     "actionEntryChangeUID",
                                     "actionSettingsChangeUID",
                                     "actionFilePrintCurEntry",
                                     "actionFilePDFCurEntry",
                                     "actionFilePreviewEntry",
                                     "actionFilePrintEntries"};
// Commands that need an open document.
const char* const kDocumentActions[] = {"actionFileSave",
                                        "actionFileSaveAs",
                                        "actionCompactDB",
                                        "actionSettingsProjectData",
                                        "actionSettingsCompanyList",
                                        "actionFormatCompany",
                                        "actionSettingsProjectLogo",
                                        "actionExchangeReport",
                                        "actionExchangeReport_2",
                                        "actionExportMasterData",
                                        "actionFilePrintEmptyEntry",
                                        "actionFilePrintCompanyList",
                                        "actionToolbarPrintCompanyList",
                                        "actionEntryNew",
                                        "actionEntryInsert",
                                        "actionEntryCopy",
                                        "actionEntryDelete",
                                        "actionEntryGotoFirst",
                                        "actionEntryGotoPrevious",
                                        "actionEntryGotoNext",
                                        "actionEntryGotoLast",
                                        "actionEntryAlterNumber",
                                        "actionEntryChangeUID",
                                        "actionFilePrintCurEntry",
                                        "actionFilePDFCurEntry",
                                        "actionFilePreviewEntry",
                                        "actionFilePrintEntries"};
// Commands the demo project refuses; disabled there rather than offered and refused.
const char* const kSaveActions[] = {"actionFileSave", "actionFileSaveAs"};

// Size of a window opened without saved geometry, and how far a further instance is moved aside.
const QSize kDefaultSize(1200, 800);
const int kInstanceOffset = 32;

// Decodes its file on first use: QIcon(file) reads every image of an .ico at once, which start-up
// need not pay for a menu that is not open.
class LazyIconEngine : public QIconEngine
{
public:
    explicit LazyIconEngine(QString file) : m_file(std::move(file)) {}
    void paint(QPainter* painter, const QRect& rect, QIcon::Mode mode, QIcon::State state) override
    {
        icon().paint(painter, rect, Qt::AlignCenter, mode, state);
    }
    QPixmap pixmap(const QSize& size, QIcon::Mode mode, QIcon::State state) override
    {
        return icon().pixmap(size, mode, state);
    }
    QSize actualSize(const QSize& size, QIcon::Mode mode, QIcon::State state) override
    {
        return icon().actualSize(size, mode, state);
    }
    QList<QSize> availableSizes(QIcon::Mode mode, QIcon::State state) const override
    {
        return icon().availableSizes(mode, state);
    }
    QIconEngine* clone() const override { return new LazyIconEngine(m_file); }
    QString key() const override { return QStringLiteral("LazyIconEngine"); }

private:
    const QIcon& icon() const
    {
        if (m_icon.isNull())
            m_icon = QIcon(m_file);
        return m_icon;
    }

    QString m_file;
    mutable QIcon m_icon;
};

// The welcome text fills the empty window; its size never decides the window's. Asking a word-wrapped
// rich-text label for its sizes lays the text out at several widths before anything is painted.
class WelcomeLabel : public QLabel
{
public:
    using QLabel::QLabel;
    QSize sizeHint() const override { return {400, 200}; }
    QSize minimumSizeHint() const override { return {100, 50}; }
    bool hasHeightForWidth() const override { return false; }
};

QString sqliteVersion()
{
    VDRScopedConnection about(QStringLiteral("ABOUT"), QStringLiteral(":memory:"), QString(), false);
    if (!about.isOpen())
        return QString();
    QSqlQuery q(about.db());
    return q.exec(QStringLiteral("SELECT sqlite_version()")) && q.next() ? q.value(0).toString() : QString();
}

} // namespace

VDRMainWindow::VDRMainWindow(QWidget* parent)
    : QMainWindow(parent), m_document(new VDRDocument(this)), m_central(new QStackedWidget(this)),
      m_welcome(new WelcomeLabel(this)), m_reportPage(new QLabel(this)),
      m_entryList(new VDREntryListWidget(this)), m_clock(new QLabel(this)), m_clockTimer(new QTimer(this)),
      m_recentIcon(
          new LazyIconEngine(QStringLiteral(":/VDRMainWindow/Resources/1 Datei/03-datei-recent.ico")))
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
    m_dockEntryList = addDock(tr("Bautagesberichte"), QStringLiteral("dockWidgetEntryList"), m_entryList,
                              Qt::LeftDockWidgetArea);
    // The calendar costs more than the rest of the dock area: it is built right after the window's
    // first paint, or when its dock first opens later.
    m_dockEntryDate = addDock(tr("Bauberichts-Kalender"), QStringLiteral("dockWidgetEntryDate"),
                              new QWidget(this), Qt::LeftDockWidgetArea);
    connect(m_dockEntryDate, &QDockWidget::visibilityChanged, this, [this](bool visible) {
        if (visible && m_painted)
            buildCalendar();
    });
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

    // The list moves the calendar to the date of the report it selects.
    connect(m_entryList, &VDREntryListWidget::dateSelected, this, [this](const QDate& date) {
        m_shownDate = date;
        if (m_calendar)
            m_calendar->showReportDate(date);
    });
    connect(m_entryList, &VDREntryListWidget::rowChangedToLockedEntry, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryDisableDelete);
    connect(m_entryList, &VDREntryListWidget::rowChangedToUnlockedEntry, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryEnableDelete);
    connect(m_entryList, &VDREntryListWidget::doEntryAllAlterNumber, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryAllAlterNumber);
    connect(m_entryList, &VDREntryListWidget::doEntryAllCopy, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryAllCopy);
    connect(m_entryList, &VDREntryListWidget::doEntryAllDelete, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryAllDelete);
    connect(m_entryList, &VDREntryListWidget::doEntryAllChangeUID, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryAllChangeUID);
    connect(m_entryList, &VDREntryListWidget::doEntryAllPrint, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryAllPrint);
    connect(m_entryList, &VDREntryListWidget::doEntryAllPdf, this,
            &VDRMainWindow::slot_dockWidgetEntryList_doEntryAllPdf);
    m_dockEntryList->installEventFilter(this);
    m_dockEntryDate->installEventFilter(this);

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
    resize(kDefaultSize);
}

// The report form costs more than the rest of the window: it is built right after the first paint,
// or by whatever needs it first.
VDREntryWidget* VDRMainWindow::entryWidget()
{
    if (m_entryWidget)
        return m_entryWidget;
    m_entryWidget = new VDREntryWidget(m_central, m_spellChecker);
    // The form's many fields must not decide the window's smallest size on a small screen.
    m_entryWidget->setMinimumSize(320, 240);
    m_central->addWidget(m_entryWidget);
    connect(m_document, &VDRDocument::documentOpened, m_entryWidget, &VDREntryWidget::slotDocumentOpened);
    connect(m_document, &VDRDocument::documentClosed, m_entryWidget, &VDREntryWidget::slotDocumentClosed);
    connect(m_entryWidget, &VDREntryWidget::doOpenHelp, this, &VDRMainWindow::showHelp);
    return m_entryWidget;
}

VDREntryWidget* VDRMainWindow::existingEntryWidget() const
{
    return findChild<VDREntryWidget*>();
}

VDRMainWindow::~VDRMainWindow()
{
    if (g_mainWindow == this)
        g_mainWindow = nullptr;
    // The document outlives this part of the window; its closing must not update it.
    disconnect(m_document, nullptr, this, nullptr);
    delete m_document;
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
            action->setToolTip(
                tr("%1 (noch nicht verfügbar)").arg(Ui_VDRMainWindowClass::plainText(action->text())));
        }
    }
    // Each action's triggered() reaches on_<its name>_triggered() where this window has one; asked per
    // action, since connectSlotsByName would match every child against every slot.
    const QMetaMethod triggered = QMetaMethod::fromSignal(&QAction::triggered);
    for (QAction* action : m_ui.allActions()) {
        const QByteArray slot = "on_" + action->objectName().toLatin1() + "_triggered";
        int index = metaObject()->indexOfSlot(QByteArray(slot + "()").constData());
        if (index < 0)
            index = metaObject()->indexOfSlot(QByteArray(slot + "(bool)").constData());
        if (index >= 0)
            connect(action, triggered, this, metaObject()->method(index));
    }
    connect(m_ui.action(QStringLiteral("actionViewEntryList")), &QAction::triggered, this, [this](bool show) {
        m_dockEntryList->setVisible(show);
        QSettings().setValue(showEntryListSettingsKey(), show);
    });
    connect(m_ui.action(QStringLiteral("actionEntrySearchByDate")), &QAction::triggered, this,
            [this](bool show) {
                m_dockEntryDate->setVisible(show);
                QSettings().setValue(showEntryDateSettingsKey(), show);
            });
    // A dock closed by its own button, or a bar hidden from its context menu, loses its check mark.
    connect(m_ui.menu(QStringLiteral("menuView")), &QMenu::aboutToShow, this,
            &VDRMainWindow::updateViewActions);
    updateViewActions();

    // F10 reaches the menus, as in other desktop programs.
    auto* menuKey = new QShortcut(QKeySequence(Qt::Key_F10), this);
    menuKey->setObjectName(QStringLiteral("shortcutMenuBar"));
    connect(menuKey, &QShortcut::activated, this,
            [this] { menuBar()->setActiveAction(menuBar()->actions().value(0)); });
}

void VDRMainWindow::updateViewActions()
{
    const struct
    {
        const char* action;
        const QWidget* widget;
    } toggles[] = {{"actionViewToolbar", m_ui.mainToolBar},
                   {"actionViewStatusbar", statusBar()},
                   {"actionViewEntryList", m_dockEntryList},
                   {"actionEntrySearchByDate", m_dockEntryDate}};
    // isHidden, not isVisible: before the window is shown everything is invisible, but not hidden.
    for (const auto& toggle : toggles)
        m_ui.action(QLatin1String(toggle.action))->setChecked(!toggle.widget->isHidden());
}

QString VDRMainWindow::demoProjectPath()
{
    return QDir(QCoreApplication::applicationDirPath() + QStringLiteral("/../Projects"))
        .absoluteFilePath(QStringLiteral("Ejemplo.vd2"));
}

QString VDRMainWindow::helpPagePath()
{
    return QDir(QCoreApplication::applicationDirPath() + QStringLiteral("/../Help"))
        .absoluteFilePath(QStringLiteral("Varduna-Hilfe.html"));
}

void VDRMainWindow::showHelp()
{
    const QString page = helpPagePath();
    if (!QFileInfo::exists(page)) {
        VDRPrompt::warning(tr("Hilfe"),
                           tr("Die Hilfe-Datei\n%1\nexistiert nicht.").arg(QDir::toNativeSeparators(page)));
        return;
    }
    if (!QDesktopServices::openUrl(QUrl::fromLocalFile(page)))
        VDRPrompt::warning(tr("Hilfe"),
                           tr("Die Hilfe konnte nicht im Browser geöffnet werden.\nSie finden sie in der "
                              "Datei\n%1")
                               .arg(QDir::toNativeSeparators(page)));
}

std::unique_ptr<QMessageBox> VDRMainWindow::createAboutBox()
{
    const QString version = QCoreApplication::applicationVersion().isEmpty()
                                ? QStringLiteral(VARDUNA_VERSION)
                                : QCoreApplication::applicationVersion();
    const QString sqlite = sqliteVersion();
    const QString text =
        tr("<h3>Varduna %1</h3>"
           "<p>Das Bautagebuch für die Baustelle.<br>© Korvant - Software</p>"
           "<p>Qt %2 (erstellt mit Qt %3)%4</p>"
           "<p><b>Mitgelieferte Bibliotheken und ihre Lizenzen</b></p>"
           "<table cellspacing=\"2\">"
           "<tr><td>Qt 5</td><td>GNU LGPL 3</td></tr>"
           "<tr><td>Qt-Übersetzungen</td><td>GNU GPL 3 mit Qt-Ausnahme 1.0</td></tr>"
           "<tr><td>SQLite</td><td>gemeinfrei (Public Domain)</td></tr>"
           "<tr><td>Hunspell</td><td>MPL 1.1 / GNU GPL 2 / GNU LGPL 2.1</td></tr>"
           "<tr><td>libexif</td><td>GNU LGPL 2.1</td></tr>"
           "<tr><td>Wörterbuch Deutsch (igerman98)</td><td>GNU GPL 2</td></tr>"
           "<tr><td>Wörterbuch Englisch (SCOWL)</td><td>BSD-artig</td></tr>"
           "<tr><td>Wörterbuch Spanisch</td><td>MPL 2.0</td></tr>"
           "</table>"
           "<p>Die Bibliotheken werden dynamisch eingebunden und können ersetzt werden; die "
           "Lizenztexte liefert das Betriebssystem mit (unter Debian in /usr/share/doc).</p>")
            .arg(version.toHtmlEscaped(), QString::fromLatin1(qVersion()), QStringLiteral(QT_VERSION_STR),
                 sqlite.isEmpty() ? QString() : tr(", SQLite %1").arg(sqlite.toHtmlEscaped()));
    auto box = std::make_unique<QMessageBox>(QMessageBox::Information, tr("Info über Varduna"), text,
                                             QMessageBox::Ok, this);
    box->setObjectName(QStringLiteral("aboutBox"));
    box->setTextFormat(Qt::RichText);
    // A message box wraps its text narrowly; the table of licences reads better wider.
    if (auto* label = box->findChild<QLabel*>(QStringLiteral("qt_msgbox_label")))
        label->setMinimumWidth(460);
    return box;
}

QRect VDRMainWindow::fittedGeometry(QRect window, const QRect& available)
{
    window.setWidth(qMin(window.width(), available.width()));
    window.setHeight(qMin(window.height(), available.height()));
    if (window.right() > available.right())
        window.moveRight(available.right());
    if (window.bottom() > available.bottom())
        window.moveBottom(available.bottom());
    if (window.left() < available.left())
        window.moveLeft(available.left());
    if (window.top() < available.top())
        window.moveTop(available.top());
    return window;
}

void VDRMainWindow::restoreWindowGeometry(const QByteArray& geometry, const QByteArray& state, int instance)
{
    const bool restored = !geometry.isEmpty() && restoreGeometry(geometry);
    restoreState(state);
    updateViewActions();
    if (isMaximized() || isFullScreen())
        return;
    QScreen* screen = restored ? QGuiApplication::screenAt(this->geometry().center()) : nullptr;
    if (!screen)
        screen = QGuiApplication::primaryScreen();
    if (!screen)
        return;
    // Room for the frame the window manager adds around the window.
    const QRect available = screen->availableGeometry().adjusted(0, 0, 0, -32);
    QRect wanted = restored ? this->geometry() : QRect(QPoint(), kDefaultSize);
    if (!restored)
        wanted.moveCenter(available.center());
    if (instance > 0) {
        // Moved aside and, where the screen ends, narrowed rather than pushed back on top of the first.
        const QPoint offset(kInstanceOffset * instance, kInstanceOffset * instance);
        const QPoint topLeft = wanted.topLeft() + offset;
        wanted.moveTopLeft(QPoint(qMin(topLeft.x(), available.left() + available.width() / 3),
                                  qMin(topLeft.y(), available.top() + available.height() / 3)));
        wanted.setRight(qMin(wanted.right(), available.right()));
        wanted.setBottom(qMin(wanted.bottom(), available.bottom()));
    }
    setGeometry(fittedGeometry(wanted, available));
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
    // What is typed into the report belongs to the diary being saved or asked about.
    if (m_entryWidget)
        m_entryWidget->actionAskForSubmit();
    if (m_document->isDemoProject()) {
        // The demo is never saved: only offer what can work.
        if (withoutQuestion) {
            VDRPrompt::information(tr("Speichern"), tr("Das Musterprojekt kann nicht gespeichert werden."));
            return 1;
        }
        if (!m_document->isStateModified())
            return 0;
        const int choice = VDRPrompt::instance()->choose(
            VDRPrompt::Question, tr("Dokument geändert"),
            tr("Das Musterprojekt wurde geändert.\nDas Musterprojekt kann nicht gespeichert werden; "
               "die Änderungen gehen beim Schließen verloren."),
            {tr("Verwerfen"), tr("Abbrechen")}, 1, 1);
        if (choice != 0)
            return 1;
        m_document->setMasterDataModified(false);
        return 0;
    }
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
    if (m_entryWidget)
        m_entryWidget->actionAskForSubmit();
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
        // Kept in the working copy, which the next opening resumes.
        if (m_entryWidget)
            m_entryWidget->actionAskForSubmit();
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
    for (const QString& path : qAsConst(m_recentFiles)) {
        // An '&' in a file name is text, not a mnemonic.
        QAction* entry = menu->addAction(
            m_recentIcon, QFileInfo(path).fileName().replace(QLatin1Char('&'), QLatin1String("&&")));
        entry->setData(path);
        entry->setToolTip(QDir::toNativeSeparators(path));
        connect(entry, &QAction::triggered, this, [this, path] {
            if (openDocument(path, true, false) == 2 && !m_document->isStateValid())
                createDocument(true);
        });
    }
    Ui_VDRMainWindowClass::assignMnemonics(menu->actions());
    menu->setEnabled(!m_recentFiles.isEmpty());
}

void VDRMainWindow::updateGui()
{
    const bool valid = m_document->isStateValid();
    for (const char* name : kDocumentActions)
        m_ui.action(QLatin1String(name))->setEnabled(valid);
    const bool demo = valid && m_document->isDemoProject();
    for (const char* name : kSaveActions) {
        QAction* action = m_ui.action(QLatin1String(name));
        action->setEnabled(valid && !demo);
        const QString tip = demo ? tr("Das Musterprojekt kann nicht gespeichert werden.")
                                 : Ui_VDRMainWindowClass::plainText(action->text());
        action->setToolTip(tip);
        action->setStatusTip(demo ? tip : QString());
    }
    updateReportPage();
    m_central->setCurrentWidget(valid ? static_cast<QWidget*>(entryWidget()) : m_welcome);
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
    // A form built now missed the signal that calls this.
    if (!m_entryWidget)
        entryWidget()->slotDocumentOpened(document);
    VDRAllEntryTableModel* model = document->modelEntryAll();
    m_entryList->slotDocumentOpened(document);
    // The list follows every report the form shows, however it got there.
    if (VDREntryWidget* form = existingEntryWidget()) {
        connect(form, &VDREntryWidget::currentRowChanged, m_entryList, &VDREntryListWidget::selectRow,
                Qt::UniqueConnection);
        // New, copied and re-authored reports may bring the first author code.
        connect(form, &VDREntryWidget::currentRowChanged, m_entryList, &VDREntryListWidget::slotShowUserIds,
                Qt::UniqueConnection);
        // The form may have shown its first report before the list had the diary.
        if (form->document() == document)
            m_entryList->selectRow(form->currentRow());
    }
    connect(model, &VDRAllEntryTableModel::reportDatesChanged, this, &VDRMainWindow::slotReportDatesChanged,
            Qt::UniqueConnection);
    model->updateDates();
    updateGui();
}

void VDRMainWindow::updateReportPage()
{
    if (!m_document->isStateValid())
        return;
    const int reports = m_document->modelEntryAll() ? m_document->modelEntryAll()->rowCount() : 0;
    const QString count = reports == 1 ? tr("1 Baubericht") : tr("%1 Bauberichte").arg(reports);
    // The heading is the project's name from its data, which may differ from the file's name.
    QString file = m_document->isStateNew()
                       ? tr("Noch nicht gespeichert")
                       : tr("Datei: %1").arg(QFileInfo(m_document->getFilepath()).fileName().toHtmlEscaped());
    const QString name = m_document->projectName();
    if (name == QLatin1String("Neues Varduna") || name == VDRDocument::tr("Neues Varduna"))
        file += tr("<br>Den Projektnamen ändern Sie unter Stammdaten - Projektdaten bearbeiten.");
    m_reportPage->setText(tr("<h2>%1</h2><p>%2</p><p>%3</p>").arg(name.toHtmlEscaped(), count, file));
}

void VDRMainWindow::slotDocumentClosed(VDRDocument* document)
{
    m_entryList->slotDocumentClosed(document);
    slotReportDatesChanged({});
    updateGui();
}

void VDRMainWindow::slotReportDatesChanged(const QList<QDate>& dates)
{
    m_reportDates = dates;
    if (m_calendar)
        markReportDates();
}

void VDRMainWindow::markReportDates()
{
    m_calendar->setAvailableDates(m_reportDates);
}

void VDRMainWindow::buildCalendar()
{
    if (m_calendar)
        return;
    m_calendar = new VDREntryDateWidget(this);
    m_calendar->setObjectName(QStringLiteral("calendar"));
    QWidget* placeholder = m_dockEntryDate->widget();
    m_dockEntryDate->setWidget(m_calendar);
    delete placeholder;
    connect(m_calendar, &VDREntryDateWidget::dateSelected, this,
            &VDRMainWindow::slot_dockWidgetEntryDate_dateSelected);
    markReportDates();
    m_calendar->showReportDate(m_shownDate);
}

bool VDRMainWindow::eventFilter(QObject* watched, QEvent* event)
{
    // Only the dock's own close button closes it; the view actions hide it.
    if (event->type() == QEvent::Close && (watched == m_dockEntryList || watched == m_dockEntryDate)) {
        const bool list = watched == m_dockEntryList;
        QSettings().setValue(list ? showEntryListSettingsKey() : showEntryDateSettingsKey(), false);
        if (m_showDockHints) {
            if (list)
                VDRPrompt::information(
                    tr("Bautagesberichte wieder einschalten"),
                    tr("Sie können die Liste der Bautagesberichte über einen rechten "
                       "Mausklick auf die Symbolleiste oder die Menüleiste wieder einschalten."));
            else
                VDRPrompt::information(
                    tr("Bauberichts-Kalender wieder einschalten"),
                    tr("Sie können den Bauberichts-Kalender über einen rechten Mausklick auf "
                       "die Symbolleiste oder die Menüleiste wieder einschalten."));
        }
    }
    return QMainWindow::eventFilter(watched, event);
}

void VDRMainWindow::checkFileSize()
{
    VDRFileSizeDialog dialog(m_document);
    if (dialog.exec() == VDRFileSizeDialog::ExportRequested)
        on_actionExportMasterData_triggered();
}

bool VDRMainWindow::event(QEvent* event)
{
    if (event->type() == QEvent::Paint && !m_painted) {
        m_painted = true;
        // Queued, so that the first paint reaches the screen first.
        if (!m_dockEntryDate->isHidden())
            QTimer::singleShot(0, this, &VDRMainWindow::buildCalendar);
        QTimer::singleShot(0, this, &VDRMainWindow::entryWidget);
    }
    return QMainWindow::event(event);
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
    updateViewActions();
}

void VDRMainWindow::on_actionViewStatusbar_triggered()
{
    statusBar()->setVisible(!statusBar()->isVisible());
    updateViewActions();
}

void VDRMainWindow::on_actionNumberOfBackups_triggered()
{
    VDRBackupConfigDialog dialog(this);
    dialog.exec();
}

void VDRMainWindow::setSpellChecker(VDRSpellChecker* checker)
{
    m_spellChecker = checker;
    VDRItemDelegate::setSpellChecker(checker);
    if (m_entryWidget)
        m_entryWidget->setSpellChecker(checker);
    QAction* action = m_ui.action(QStringLiteral("actionStartSpellChecking"));
    action->setEnabled(checker && checker->isValid());
    action->setText(checker && checker->isActive() ? tr("Rechtschreibprüfung aus")
                                                   : tr("Rechtschreibprüfung ein"));
    Ui_VDRMainWindowClass::assignMnemonics(m_ui.menu(QStringLiteral("menuSettings"))->actions());
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

void VDRMainWindow::on_actionHelpShowHelp_triggered()
{
    showHelp();
}

void VDRMainWindow::on_actionHelpInfoDialog_triggered()
{
    createAboutBox()->exec();
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

void VDRMainWindow::showProjectData(int tab, bool printButton)
{
    if (!m_document->isStateValid())
        return;
    VDRProjectDataWidget dialog(this, m_spellChecker);
    dialog.slotDocumentOpened(m_document);
    dialog.activateTab(VDRProjectDataWidget::SettingsType(tab));
    dialog.setPrintButtonVisible(printButton);
    connect(&dialog, &VDRProjectDataWidget::printProjectDataRequested, this,
            &VDRMainWindow::on_actionFilePrintCompanyList_triggered);
    if (dialog.exec() == QDialog::Accepted)
        updateGui();
}

void VDRMainWindow::on_actionSettingsProjectData_triggered()
{
    showProjectData(VDRProjectDataWidget::ST_PROJECTDATA, false);
}

void VDRMainWindow::on_actionSettingsCompanyList_triggered()
{
    showProjectData(VDRProjectDataWidget::ST_COMPANYLIST, true);
}

void VDRMainWindow::on_actionFormatCompany_triggered()
{
    showProjectData(VDRProjectDataWidget::ST_COMPANYFORMAT, true);
}

void VDRMainWindow::on_actionSettingsProjectLogo_triggered()
{
    if (!m_document->isStateValid())
        return;
    VDRProjectLogoWidget dialog(this);
    dialog.slotDocumentOpened(m_document);
    if (dialog.exec() == QDialog::Accepted)
        updateGui();
}
