#include "app/Ui_VDRMainWindowClass.h"

#include <QAction>
#include <QKeySequence>
#include <QMainWindow>
#include <QMenu>
#include <QMenuBar>
#include <QSet>
#include <QToolBar>

namespace {

// One entry of a menu: an action (object name, label), a separator ("-"), or a submenu (an
// object name starting with "menu", whose entries follow in kMenus).
struct Entry
{
    const char* name;
    const char* label;
};

struct MenuDef
{
    const char* name;
    const char* title;
    std::initializer_list<Entry> entries;
};

const MenuDef kMenus[] = {
    {"menuFile",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Datei"),
     {{"actionFileNew", QT_TRANSLATE_NOOP("VDRMainWindow", "Neu")},
      {"actionFileOpen", QT_TRANSLATE_NOOP("VDRMainWindow", "Öffnen")},
      {"menuFileRecent", nullptr},
      {"actionOpenDemoProject", QT_TRANSLATE_NOOP("VDRMainWindow", "Musterprojekt öffnen")},
      {"menuSyncFiles", nullptr},
      {"-", nullptr},
      {"actionFileSave", QT_TRANSLATE_NOOP("VDRMainWindow", "Speichern")},
      {"actionFileSaveAs", QT_TRANSLATE_NOOP("VDRMainWindow", "Speichern unter")},
      {"-", nullptr},
      {"actionCompactDB", QT_TRANSLATE_NOOP("VDRMainWindow", "Datenbank bereinigen")},
      {"-", nullptr},
      {"actionImagesExport", QT_TRANSLATE_NOOP("VDRMainWindow", "Bilder exportieren")},
      {"actionDictationManager", QT_TRANSLATE_NOOP("VDRMainWindow", "Diktate verwalten")},
      {"actionDataExport", QT_TRANSLATE_NOOP("VDRMainWindow", "Tabellen exportieren")},
      {"-", nullptr},
      {"actionFileExit", QT_TRANSLATE_NOOP("VDRMainWindow", "Beenden")}}},
    {"menuFileRecent", QT_TRANSLATE_NOOP("VDRMainWindow", "Vorherige Dateien..."), {}},
    {"menuSyncFiles", QT_TRANSLATE_NOOP("VDRMainWindow", "Synchronisierte Dateien..."), {}},
    {"menuDrucken",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Drucken"),
     {{"actionFilePreviewEntry", QT_TRANSLATE_NOOP("VDRMainWindow", "Seitenansicht Baubericht")},
      {"actionFilePrintEntries", QT_TRANSLATE_NOOP("VDRMainWindow", "Baubericht")},
      {"actionFilePrintEmptyEntry", QT_TRANSLATE_NOOP("VDRMainWindow", "Leeres Formblatt")},
      {"actionProjektdatenblatt", QT_TRANSLATE_NOOP("VDRMainWindow", "Projektdatenblatt")},
      {"actionFilePrintCompanyList", QT_TRANSLATE_NOOP("VDRMainWindow", "Firmenliste")},
      {"actionTimeRecording", QT_TRANSLATE_NOOP("VDRMainWindow", "Baubesetzung Stundenlisten")},
      {"actionMangelListe", QT_TRANSLATE_NOOP("VDRMainWindow", "Mängelliste")},
      {"actionDelayList", QT_TRANSLATE_NOOP("VDRMainWindow", "Verzüge")},
      {"actionObstructionList", QT_TRANSLATE_NOOP("VDRMainWindow", "Behinderungen")},
      {"actionMeasureList", QT_TRANSLATE_NOOP("VDRMainWindow", "Wichtige Baumaßnahmen")},
      {"actionDirectiveList", QT_TRANSLATE_NOOP("VDRMainWindow", "Weisungen")},
      {"actionAuxiliaryServiceList", QT_TRANSLATE_NOOP("VDRMainWindow", "Zusatzleistungen")},
      {"actionMaterialList", QT_TRANSLATE_NOOP("VDRMainWindow", "Baustoffe")},
      {"actionDeliveryList", QT_TRANSLATE_NOOP("VDRMainWindow", "Pläne und Dokumente")},
      {"actionEquipment", QT_TRANSLATE_NOOP("VDRMainWindow", "Geräteeinsatz")},
      {"actionReport2PDF", QT_TRANSLATE_NOOP("VDRMainWindow", "Eigene Berichte...")}}},
    {"menuSynchronisation",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Synchronisation"),
     {{"menuCloudSynchronisation", nullptr}, {"menuManuelle_Synchronisation", nullptr}}},
    {"menuCloudSynchronisation",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Automatisch"),
     {{"actionSelectCloud", QT_TRANSLATE_NOOP("VDRMainWindow", "Cloud auswählen")},
      {"actionStartCloudSync", QT_TRANSLATE_NOOP("VDRMainWindow", "Synchronisation einschalten")},
      {"actionStopCloudSync", QT_TRANSLATE_NOOP("VDRMainWindow", "Synchronisation ausschalten")},
      {"actionSyncNewCloudFile",
       QT_TRANSLATE_NOOP("VDRMainWindow", "Erst-Import eines Vardunas von anderem Gerät per Cloud")},
      {"actionShowCloudSyncFiles", QT_TRANSLATE_NOOP("VDRMainWindow", "Synchronisierte Dateien anzeigen")},
      {"actionDropboxSyncShortHelpMobile", QT_TRANSLATE_NOOP("VDRMainWindow", "Kurzanleitung Mobilgerät")},
      {"actionDropboxSyncShortHelpNotebook", QT_TRANSLATE_NOOP("VDRMainWindow", "Kurzanleitung Notebook")}}},
    {"menuManuelle_Synchronisation",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Manuell"),
     {{"menuExportReport", nullptr},
      {"menuExportMasterData", nullptr},
      {"actionExchangeReport", QT_TRANSLATE_NOOP("VDRMainWindow", "Import von Bauberichten")}}},
    {"menuExportReport",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Export des Vardunas"),
     {{"actionExportDatabaseByEmail", QT_TRANSLATE_NOOP("VDRMainWindow", "Email")},
      {"actionExportDatabaseBySdCard", QT_TRANSLATE_NOOP("VDRMainWindow", "SD-Karte")},
      {"actionExportDatabaseByUSB", QT_TRANSLATE_NOOP("VDRMainWindow", "USB")}}},
    {"menuExportMasterData",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Export der Stammdaten"),
     {{"actionExportMasterDataByEmail", QT_TRANSLATE_NOOP("VDRMainWindow", "Email")},
      {"actionExportMasterDataBySdCard", QT_TRANSLATE_NOOP("VDRMainWindow", "SD-Karte")},
      {"actionExportMasterDataByUSB", QT_TRANSLATE_NOOP("VDRMainWindow", "USB")}}},
    {"menuMasterData",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Stammdaten"),
     {{"actionSettingsProjectData", QT_TRANSLATE_NOOP("VDRMainWindow", "Projektdaten bearbeiten")},
      {"actionSettingsCompanyList", QT_TRANSLATE_NOOP("VDRMainWindow", "Firmenliste bearbeiten")},
      {"actionSettingsProjectLogo", QT_TRANSLATE_NOOP("VDRMainWindow", "Logo hinzufügen / bearbeiten")},
      {"actionSettingsChangeUID", QT_TRANSLATE_NOOP("VDRMainWindow", "Benutzer-ID des aktuellen Autors")},
      {"menuFirmenliste_Im_Export", nullptr},
      {"actionExportMasterData", QT_TRANSLATE_NOOP("VDRMainWindow", "Stammdaten in neue Datei kopieren")}}},
    {"menuFirmenliste_Im_Export",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Firmen Im-/Export"),
     {{"actionImportExternalCompanies",
       QT_TRANSLATE_NOOP("VDRMainWindow", "Import aus externer Adress-Datei")},
      {"actionEntryImportTextCompany", QT_TRANSLATE_NOOP("VDRMainWindow", "Import aus anderem Varduna")},
      {"actionEntryExportTextCompany", QT_TRANSLATE_NOOP("VDRMainWindow", "Export")}}},
    {"menuEntry",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Baubericht"),
     {{"actionEntryNew", QT_TRANSLATE_NOOP("VDRMainWindow", "Neu")},
      {"actionEntryCopy", QT_TRANSLATE_NOOP("VDRMainWindow", "Kopieren")},
      {"actionEntryDelete", QT_TRANSLATE_NOOP("VDRMainWindow", "Löschen")},
      {"actionEntryInsert", QT_TRANSLATE_NOOP("VDRMainWindow", "Nachtragen")},
      {"actionExchangeReport_2", QT_TRANSLATE_NOOP("VDRMainWindow", "Importieren")},
      {"actionSettingsSearch", QT_TRANSLATE_NOOP("VDRMainWindow", "Suchen")},
      {"actionEntryAlterNumber", QT_TRANSLATE_NOOP("VDRMainWindow", "Nummer ändern")},
      {"actionEntryChangeUID", QT_TRANSLATE_NOOP("VDRMainWindow", "Autor ändern")},
      {"actionEntrySendAsEmail", QT_TRANSLATE_NOOP("VDRMainWindow", "Per E-Mail versenden")}}},
    {"menuSettings",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Einstellungen"),
     {{"actionFormatCompany", QT_TRANSLATE_NOOP("VDRMainWindow", "Firmendaten Ausgabeformat")},
      {"actionFotos_verkleinern", QT_TRANSLATE_NOOP("VDRMainWindow", "Bildgröße Fotos einstellen")},
      {"actionSettingsSketchSize", QT_TRANSLATE_NOOP("VDRMainWindow", "Bildgröße Skizzen einstellen")},
      {"actionSettingsLanguage", QT_TRANSLATE_NOOP("VDRMainWindow", "Sprache wählen")},
      {"actionPrintoutSettings", QT_TRANSLATE_NOOP("VDRMainWindow", "Druckeinstellungen")},
      {"actionSchriftarten", QT_TRANSLATE_NOOP("VDRMainWindow", "Schriftarten ändern")},
      {"actionDrucktexte", QT_TRANSLATE_NOOP("VDRMainWindow", "Texte ändern - Druck")},
      {"actionVorschlagtexte", QT_TRANSLATE_NOOP("VDRMainWindow", "Texte ändern - Eingabe")},
      {"actionBerichte_bearbeiten", QT_TRANSLATE_NOOP("VDRMainWindow", "Eigene Berichte erstellen")},
      {"actionNumberOfBackups", QT_TRANSLATE_NOOP("VDRMainWindow", "Datensicherung Backups")},
      {"actionFileSizeWarning", QT_TRANSLATE_NOOP("VDRMainWindow", "Stammdaten Export")},
      {"-", nullptr},
      {"actionStartSpellChecking", QT_TRANSLATE_NOOP("VDRMainWindow", "Rechtschreibprüfung aus")},
      {"-", nullptr},
      {"actionExportImportSettings", QT_TRANSLATE_NOOP("VDRMainWindow", "Einstellungen sichern/laden")}}},
    {"menuView",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Ansicht"),
     {{"actionViewToolbar", QT_TRANSLATE_NOOP("VDRMainWindow", "Symbolleiste")},
      {"actionViewStatusbar", QT_TRANSLATE_NOOP("VDRMainWindow", "Statusleiste")},
      {"actionViewEntryList", QT_TRANSLATE_NOOP("VDRMainWindow", "Bautagesberichte")},
      {"actionEntrySearchByDate", QT_TRANSLATE_NOOP("VDRMainWindow", "Bauberichts-Kalender")},
      {"actionViewSaveRevertButtons", QT_TRANSLATE_NOOP("VDRMainWindow", "Speichern/Verwerfen-Knöpfe")},
      {"actionViewPhotoAlbum", QT_TRANSLATE_NOOP("VDRMainWindow", "Fotoalbum öffnen")},
      {"actionUploadPhotoAlbum", QT_TRANSLATE_NOOP("VDRMainWindow", "Fotoalbum hochladen")}}},
    {"menuHelp",
     QT_TRANSLATE_NOOP("VDRMainWindow", "Hilfe"),
     {{"actionHelpHints", QT_TRANSLATE_NOOP("VDRMainWindow", "Tips und Tricks")},
      {"actionShowWelcomePage", QT_TRANSLATE_NOOP("VDRMainWindow", "Starthilfe")},
      {"actionHelpShowHelp", QT_TRANSLATE_NOOP("VDRMainWindow", "Hilfe")},
      {"actionUpdateTest", QT_TRANSLATE_NOOP("VDRMainWindow", "Auf Updates prüfen")},
      {"actionHelpInfoDialog", QT_TRANSLATE_NOOP("VDRMainWindow", "Info über Varduna")}}},
};

const char* const kTopLevelMenus[] = {"menuFile",       "menuDrucken", "menuSynchronisation",
                                      "menuMasterData", "menuEntry",   "menuSettings",
                                      "menuView",       "menuHelp"};

// Tool-bar-only actions and their labels.
const Entry kToolBarOnly[] = {
    {"actionFilePDFCurEntry", QT_TRANSLATE_NOOP("VDRMainWindow", "Aktuellen Baubericht als PDF")},
    {"actionFilePrintCurEntry", QT_TRANSLATE_NOOP("VDRMainWindow", "Aktuellen Baubericht drucken")},
    {"actionToolbarPrintCompanyList", QT_TRANSLATE_NOOP("VDRMainWindow", "Firmenliste drucken")},
    {"actionStartSpellCheckerDialog", QT_TRANSLATE_NOOP("VDRMainWindow", "Rechtschreibprüfung")},
};

// The report navigation belongs to the report form; the actions live in the window so that their
// keys work wherever the focus is.
const Entry kWindowOnly[] = {
    {"actionEntryGotoFirst", QT_TRANSLATE_NOOP("VDRMainWindow", "Erster Baubericht")},
    {"actionEntryGotoPrevious", QT_TRANSLATE_NOOP("VDRMainWindow", "Vorheriger Baubericht")},
    {"actionEntryGotoNext", QT_TRANSLATE_NOOP("VDRMainWindow", "Nächster Baubericht")},
    {"actionEntryGotoLast", QT_TRANSLATE_NOOP("VDRMainWindow", "Letzter Baubericht")},
};

// The platform's standard keys; the fixed one where the platform has none (Windows knows no
// "save as" or "quit" key).
struct ShortcutDef
{
    const char* action;
    QKeySequence::StandardKey standard;
    int fallback;
};
const ShortcutDef kShortcuts[] = {
    {"actionFileNew", QKeySequence::New, Qt::CTRL | Qt::Key_N},
    {"actionFileOpen", QKeySequence::Open, Qt::CTRL | Qt::Key_O},
    {"actionFileSave", QKeySequence::Save, Qt::CTRL | Qt::Key_S},
    {"actionFileSaveAs", QKeySequence::SaveAs, Qt::CTRL | Qt::SHIFT | Qt::Key_S},
    {"actionFilePrintEntries", QKeySequence::Print, Qt::CTRL | Qt::Key_P},
    {"actionFileExit", QKeySequence::Quit, Qt::CTRL | Qt::Key_Q},
    {"actionHelpShowHelp", QKeySequence::HelpContents, Qt::Key_F1},
    {"actionEntryGotoPrevious", QKeySequence::UnknownKey, Qt::CTRL | Qt::Key_PageUp},
    {"actionEntryGotoNext", QKeySequence::UnknownKey, Qt::CTRL | Qt::Key_PageDown},
    {"actionEntryGotoFirst", QKeySequence::UnknownKey, Qt::CTRL | Qt::SHIFT | Qt::Key_PageUp},
    {"actionEntryGotoLast", QKeySequence::UnknownKey, Qt::CTRL | Qt::SHIFT | Qt::Key_PageDown},
};

// Toggles of the Ansicht menu that show a check mark.
const char* const kCheckable[] = {"actionViewToolbar", "actionViewStatusbar", "actionViewEntryList",
                                  "actionEntrySearchByDate"};

const char* const kToolBar[] = {"actionFileNew",
                                "actionFileOpen",
                                "actionFileSave",
                                "-",
                                "actionFilePreviewEntry",
                                "actionFilePDFCurEntry",
                                "actionFilePrintEntries",
                                "actionFilePrintCurEntry",
                                "actionFilePrintEmptyEntry",
                                "actionToolbarPrintCompanyList",
                                "-",
                                "actionSettingsCompanyList",
                                "actionSettingsProjectData",
                                "actionSettingsProjectLogo",
                                "-",
                                "actionEntryNew",
                                "actionEntryCopy",
                                "actionEntryDelete",
                                "actionEntryInsert",
                                "actionExchangeReport_2",
                                "actionEntrySendAsEmail",
                                "actionSettingsSearch",
                                "-",
                                "actionViewPhotoAlbum",
                                "actionUploadPhotoAlbum",
                                "actionImagesExport",
                                "actionStartSpellCheckerDialog",
                                "-",
                                "actionHelpShowHelp"};

const MenuDef* findMenu(const QString& name)
{
    for (const MenuDef& m : kMenus) {
        if (name == QLatin1String(m.name))
            return &m;
    }
    return nullptr;
}

// Where the mnemonic of 'text' goes: the first letter its siblings have not taken, preferring the
// start of a word and plain letters that every keyboard has.
int mnemonicPosition(const QString& text, const QSet<QChar>& taken)
{
    for (int pass = 0; pass < 3; ++pass) {
        for (int i = 0; i < text.size(); ++i) {
            const QChar c = text.at(i);
            if (!c.isLetter() || taken.contains(c.toLower()))
                continue;
            const bool plain = c.unicode() < 128;
            const bool wordStart = i == 0 || !text.at(i - 1).isLetterOrNumber();
            if ((pass == 0 && plain && wordStart) || (pass == 1 && plain) || pass == 2)
                return i;
        }
    }
    return -1;
}

} // namespace

QString Ui_VDRMainWindowClass::plainText(QString text)
{
    text.replace(QLatin1String("&&"), QString(QChar(0x1)));
    text.remove(QLatin1Char('&'));
    text.replace(QChar(0x1), QLatin1Char('&'));
    return text;
}

void Ui_VDRMainWindowClass::assignMnemonics(const QList<QAction*>& actions)
{
    QSet<QChar> taken;
    for (QAction* action : actions) {
        if (action->isSeparator())
            continue;
        const QString text = plainText(action->text());
        const auto escaped = [](QString part) { return part.replace(QLatin1Char('&'), QLatin1String("&&")); };
        const int at = mnemonicPosition(text, taken);
        if (at < 0) {
            action->setText(escaped(text));
            continue;
        }
        taken.insert(text.at(at).toLower());
        action->setText(escaped(text.left(at)) + QLatin1Char('&') + escaped(text.mid(at)));
    }
}

QAction* Ui_VDRMainWindowClass::makeAction(QMainWindow* window, const QString& name, const QString& label)
{
    auto* action = new QAction(label, window);
    action->setObjectName(name);
    action->setToolTip(label);
    m_actions.insert(name, action);
    return action;
}

QMenu* Ui_VDRMainWindowClass::buildMenu(QMainWindow* window, QMenu* parent, const QString& name)
{
    const MenuDef* def = findMenu(name);
    QMenu* menu = parent ? parent->addMenu(tr(def->title)) : window->menuBar()->addMenu(tr(def->title));
    menu->setObjectName(name);
    m_menus.insert(name, menu);
    for (const Entry& e : def->entries) {
        const QString entry = QLatin1String(e.name);
        if (entry == QLatin1String("-"))
            menu->addSeparator();
        else if (entry.startsWith(QLatin1String("menu")))
            buildMenu(window, menu, entry);
        else
            menu->addAction(makeAction(window, entry, tr(e.label)));
    }
    assignMnemonics(menu->actions());
    return menu;
}

void Ui_VDRMainWindowClass::setupUi(QMainWindow* window)
{
    for (const char* name : kTopLevelMenus)
        buildMenu(window, nullptr, QLatin1String(name));
    menuFileRecent = m_menus.value(QStringLiteral("menuFileRecent"));
    menuSyncFiles = m_menus.value(QStringLiteral("menuSyncFiles"));
    assignMnemonics(window->menuBar()->actions());
    for (const Entry& e : kToolBarOnly)
        makeAction(window, QLatin1String(e.name), tr(e.label));
    for (const Entry& e : kWindowOnly)
        window->addAction(makeAction(window, QLatin1String(e.name), tr(e.label)));
    for (const ShortcutDef& s : kShortcuts) {
        QList<QKeySequence> keys = QKeySequence::keyBindings(s.standard);
        if (keys.isEmpty())
            keys << QKeySequence(s.fallback);
        m_actions.value(QLatin1String(s.action))->setShortcuts(keys);
    }
    for (const char* name : kCheckable)
        m_actions.value(QLatin1String(name))->setCheckable(true);

    mainToolBar = new QToolBar(tr("Symbolleiste"), window);
    mainToolBar->setObjectName(QStringLiteral("mainToolBar"));
    window->addToolBar(Qt::TopToolBarArea, mainToolBar);
    for (const char* name : kToolBar) {
        if (qstrcmp(name, "-") == 0)
            mainToolBar->addSeparator();
        else
            mainToolBar->addAction(m_actions.value(QLatin1String(name)));
    }
}
