#pragma once

#include "app/Ui_VDRMainWindowClass.h"

#include <QDate>
#include <QIcon>
#include <QMainWindow>
#include <QStringList>

#include <memory>

class QDockWidget;
class QLabel;
class QMessageBox;
class QStackedWidget;
class QTableView;
class QTimer;
class VDRDocument;
class VDREntryDateWidget;
class VDREntryListWidget;
class VDREntryWidget;
class VDRSpellChecker;

// The one main window: menus, tool bar, docks, status bar and the document-level commands.
class VDRMainWindow : public QMainWindow
{
    Q_OBJECT
public:
    explicit VDRMainWindow(QWidget* parent = nullptr);
    ~VDRMainWindow() override;

    VDRDocument* document() const { return m_document; }
    VDREntryWidget* entryWidget();
    // The start-up's spell checker; text fields ask it. May be null.
    void setSpellChecker(VDRSpellChecker* checker);
    VDRSpellChecker* spellChecker() const { return m_spellChecker; }
    Ui_VDRMainWindowClass& ui() { return m_ui; }

    // 0 = opened, 2 = cancelled or failed. An empty path asks for a file.
    int openDocument(const QString& path, bool noRecentEntry, bool noSaveQuestion);
    bool createDocument(bool hideSyncButton);
    // 0 = the caller may go on (saved, or changes discarded), any other value = cancelled.
    int saveDocument(bool saveAs, bool withoutQuestion);
    // True when no document is open afterwards.
    bool closeDocument(bool askToSave);
    // Imports one exchange file of the mobile app into the open diary, with the manual summary.
    int importExchangeFile(const QString& path);
    void updateGui4ManualReportExchangeFileImport();

    void addRecentFile(const QString& path);
    void removeRecentFile(const QString& path);
    QStringList recentFiles() const { return m_recentFiles; }
    void updateGuiRecentFileList();
    void updateGui();
    void updateStatusBar();

    // The demo project beside the program ("../Projects/Ejemplo.vd2").
    static QString demoProjectPath();
    // The help page beside the program ("../Help/Varduna-Hilfe.html").
    static QString helpPagePath();
    // Opens the help page in the system's browser; says so when it cannot.
    void showHelp();
    // The "Info über Varduna" box: program, version, Qt, and the licences of the libraries shipped.
    std::unique_ptr<QMessageBox> createAboutBox();

    // Restores the saved geometry and state; a further running instance ('instance' > 0) is moved
    // aside so it does not hide the first. The result always fits the screen.
    void restoreWindowGeometry(const QByteArray& geometry, const QByteArray& state, int instance);
    // 'window' moved and shrunk so that it lies within 'available', keeping as much of its place
    // and size as fits.
    static QRect fittedGeometry(QRect window, const QRect& available);

    // Ends at once, as on logout: unsaved work stays in the working copy for the next opening.
    void endSession();

    static QString recentFileListSettingsKey() { return QStringLiteral("recentFileList"); }
    static QString geometrySettingsKey() { return QStringLiteral("MainWindow/geometry"); }
    static QString windowStateSettingsKey() { return QStringLiteral("MainWindow/windowState"); }
    static QString showEntryListSettingsKey() { return QStringLiteral("MainWindow/showDockWidgetEntryList"); }
    static QString showEntryDateSettingsKey() { return QStringLiteral("MainWindow/showDockWidgetEntryDate"); }

    VDREntryListWidget* entryListWidget() const { return m_entryList; }
    // Null until the calendar dock is first shown.
    VDREntryDateWidget* entryDateWidget() const { return m_calendar; }
    // Closing a report dock by its button tells how to get it back, while this is on.
    void setShowDockHints(bool show) { m_showDockHints = show; }
    // Runs the report selection dialog; 'ids' gets the chosen reports in row order and 'pdfFileName'
    // (may be null) the proposed PDF name. Returns what closed the dialog (0 = cancelled).
    int displayEntrySelector(QList<int>& ids, int mode, const QString& title, QString* pdfFileName = nullptr);

public slots:
    void slotDocumentOpened(VDRDocument* document);
    void slotDocumentClosed(VDRDocument* document);
    void showWelcomePage();
    void slot_dockWidgetEntryDate_dateSelected(const QDate& date, bool& found);
    void slot_dockWidgetEntryList_doEntryDisableDelete();
    void slot_dockWidgetEntryList_doEntryEnableDelete();
    void slot_dockWidgetEntryList_doEntryAllAlterNumber(int row);
    void slot_dockWidgetEntryList_doEntryAllCopy(int row);
    void slot_dockWidgetEntryList_doEntryAllDelete(int row);
    void slot_dockWidgetEntryList_doEntryAllChangeUID(int row);
    void slot_dockWidgetEntryList_doEntryAllPrint(int row);
    void slot_dockWidgetEntryList_doEntryAllPdf(int row);

private slots:
    void on_actionFileNew_triggered();
    void on_actionFileOpen_triggered();
    void on_actionFileSave_triggered();
    void on_actionFileSaveAs_triggered();
    void on_actionOpenDemoProject_triggered();
    void on_actionFileExit_triggered();
    void on_actionViewToolbar_triggered();
    void on_actionViewStatusbar_triggered();
    void on_actionNumberOfBackups_triggered();
    void on_actionCompactDB_triggered();
    void on_actionStartSpellChecking_triggered();
    void on_actionVorschlagtexte_triggered();
    void on_actionHelpShowHelp_triggered();
    void on_actionHelpInfoDialog_triggered();
    void on_actionExchangeReport_triggered();
    void on_actionExchangeReport_2_triggered();
    void on_actionExportMasterData_triggered();
    void slotReportDatesChanged(const QList<QDate>& dates);
    void on_actionSettingsProjectData_triggered();
    void on_actionSettingsCompanyList_triggered();
    void on_actionFormatCompany_triggered();
    void on_actionSettingsProjectLogo_triggered();
    void on_actionFilePrintEmptyEntry_triggered();
    void on_actionFilePrintCompanyList_triggered();
    void on_actionToolbarPrintCompanyList_triggered();
    void on_actionPrintoutSettings_triggered();
    void on_actionSchriftarten_triggered();
    void on_actionDrucktexte_triggered();
    void on_actionEntryNew_triggered();
    void on_actionEntryInsert_triggered();
    void on_actionEntryCopy_triggered();
    void on_actionEntryDelete_triggered();
    void on_actionEntryGotoFirst_triggered();
    void on_actionEntryGotoPrevious_triggered();
    void on_actionEntryGotoNext_triggered();
    void on_actionEntryGotoLast_triggered();
    void on_actionEntryAlterNumber_triggered();
    void on_actionEntryChangeUID_triggered();
    void on_actionSettingsChangeUID_triggered();
    void on_actionFilePrintCurEntry_triggered();
    void on_actionFilePDFCurEntry_triggered();
    void on_actionFilePreviewEntry_triggered();
    void on_actionFilePrintEntries_triggered();

protected:
    bool event(QEvent* event) override;
    bool eventFilter(QObject* watched, QEvent* event) override;
    void closeEvent(QCloseEvent* event) override;

private:
    // The report form if it has been built; unlike entryWidget() it never builds one.
    VDREntryWidget* existingEntryWidget() const;
    QDockWidget* addDock(const QString& title, const QString& objectName, QWidget* content,
                         Qt::DockWidgetArea area);
    void connectActions();
    // Check marks of the Ansicht menu follow what is shown.
    void updateViewActions();
    void updateReportPage();
    void markReportDates();
    // Shows the report of 'row', runs one of the form's commands on it and has the list select
    // the report then shown.
    void runOnEntryRow(int row, void (VDREntryWidget::*command)());
    void buildCalendar();
    void checkFileSize();
    // Suggestion texts learnt in fields reach the settings (the cloud copy follows with the sync).
    void syncCompleterTexts();
    // The master-data dialog on one of its tabs; the window shows the result after OK.
    void showProjectData(int tab, bool printButton);
    // A diary is open and the form's pending edits are in the working copy: printing may read it.
    bool readyToPrint();
    // The row of the report shown, -1 for none.
    int currentEntryRow();
    // 'output' is a CVdPrintout::Output; the PDF name is proposed in a dialog.
    void printCurrentEntry(int output);
    void printEntryRow(int row, int output);
    void printEntries(const QList<int>& ids, int output, const QString& pdfFileName);

    Ui_VDRMainWindowClass m_ui;
    VDRDocument* m_document;
    QStringList m_recentFiles;
    QStackedWidget* m_central;
    QLabel* m_welcome;
    QLabel* m_reportPage;
    VDREntryListWidget* m_entryList;
    VDREntryDateWidget* m_calendar = nullptr;
    QList<QDate> m_reportDates;
    QDate m_shownDate;
    bool m_showDockHints = true;
    QDockWidget* m_dockEntryList;
    QDockWidget* m_dockEntryDate;
    QLabel* m_clock;
    QTimer* m_clockTimer;
    QIcon m_recentIcon;
    bool m_painted = false;
    VDRSpellChecker* m_spellChecker = nullptr;
    VDREntryWidget* m_entryWidget = nullptr;
};

// The one main window of the process, set at start-up.
extern VDRMainWindow* g_mainWindow;
