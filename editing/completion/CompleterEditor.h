#pragma once

#include "editing/form/VDRRegisterNames.h"

#include <QDialog>

class CompleterModel;
class CompleterStringListModel;
class QListView;
class QModelIndex;
class QTableView;

// The dialog "Autovervollständigen bearbeiten": every stored list of the current language, its
// on/off state and its entries. Changes reach the settings only on OK.
class CompleterEditor : public QDialog
{
    Q_OBJECT
public:
    explicit CompleterEditor(QWidget* parent = nullptr);

    // Writes the shipped lists; with onlyIfMissing only when the language's group does not exist
    // yet, otherwise after removing the whole group.
    static void resetToDefaults(bool onlyIfMissing);
    // The lists a new diary needs, each written only when it is missing.
    static void writeNewDocumentDefaults();
    static void writeEntry(VDRRegisterNames::RegisterNames regIdx, const QString& title, QString column,
                           const QStringList& entries);
    // Live completers write their lists, the editor runs, and they re-read them. True on OK.
    static bool editCompleters(QWidget* parent);

    // Reads the stored lists into the table.
    void initCompleters();
    CompleterModel* completerModel() const { return m_model; }
    CompleterStringListModel* stringModel() const { return m_strings; }
    // True when nothing is unsaved or the user agrees to drop the changes.
    bool allowClose();

public slots:
    void accept() override;
    void reject() override;

private slots:
    void slotCurrentRowChanged(const QModelIndex& current, const QModelIndex& previous);
    void slotAddEntry();
    void slotRemoveEntry();
    void slotRemoveAll();
    void slotReset();

private:
    void storeCurrent();

    CompleterModel* m_model;
    CompleterStringListModel* m_strings;
    QTableView* m_table;
    QListView* m_list;
    int m_currentRow = -1;
};
