#pragma once

#include <QCompleter>
#include <QStringList>

class QKeyEvent;
class QStringListModel;

// A field's suggestion list: the full texts (newest first) kept in the settings group
// "completer_<language>/<title>/<column or simple>", and the one-line display forms the popup shows.
class VDRCompleter : public QCompleter
{
    Q_OBJECT
public:
    VDRCompleter(int regIdx, QString title, int tableID, QString column, int columnID, QObject* widget);
    ~VDRCompleter() override;

    static constexpr int MaxDisplayLength = 60;
    static const QString SimpleColumn;               // "simple"
    static const QString DontShowMessageSettingsKey; // "Messages/dontShowCompleterMsg"

    // The language number from the key "language" (default: the system locale's language).
    static int language();
    // "completer_<language>"
    static QString settingsGroup();
    // Line breaks as " | ", whitespace simplified, cut to its first 60 characters.
    static QString displayText(const QString& entry);

    void readSettings();
    // Writes the whole list; 'withUpdateTime' also stamps updateTime.
    void writeSettings(bool withUpdateTime = false);
    void appendEntry(QString text);
    void removeEntry(int index);
    // The full entry behind a display text (the first that has it), or the text itself.
    QString getMultiLineEntry(const QString& display) const;
    void setActive(bool active);
    bool isActive() const { return m_enabled; }
    // Re-reads enabled and entries.
    void updateStatus();
    // Learns the text of the line edit it belongs to.
    void updateFromWidget();
    int registerIndex() const { return m_regIdx; }
    void resetCompleterRegIdx(int regIdx);
    int size() const { return m_entries.size(); }

    QString title() const { return m_title; }
    QString column() const { return m_column; }
    QStringList entries() const { return m_entries; }
    QStringList displayList() const { return m_display; }

    // Field support shared by the line edit and the text edit.
    // True when the open popup takes this key; the field must then ignore the event.
    bool popupTakesKey(QKeyEvent* event) const;
    // After the field handled a key: hides and re-offers the popup for 'prefix'.
    void offer(QKeyEvent* event, const QString& prefix, const QRect& cursorRect);
    // The field's list button: all entries, or the "Autotexte" box when the list is empty.
    void showAll(const QRect& rect);

    // Every live completer.
    static QList<VDRCompleter*> liveCompleters();
    // Each live completer writes its list (before the editor opens, before synchronising).
    static void writeAll();
    // Each live completer re-reads its list (after the editor or a synchronisation changed them).
    static void updateAll();
    // Brings stored lists of older versions up to date at start-up.
    static void migrateSettings();

private:
    QString listGroup() const;
    void rebuildModel();
    void openPopup(const QRect& rect);

    int m_regIdx;
    QString m_title;
    int m_tableID;
    QString m_column;
    int m_columnID;
    bool m_enabled = true;
    QStringList m_entries;
    QStringList m_display;
    QStringListModel* m_model;
};
