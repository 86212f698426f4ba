#pragma once

#include <QComboBox>

class VDRDocument;
class VDRSqlTableModel;

// Chooses a person or company of the master data by its formatted name; the first item "Neu..."
// creates one on the fly. Item data is the company id.
class CVdCompanyComboBox : public QComboBox
{
    Q_OBJECT
public:
    explicit CVdCompanyComboBox(QWidget* parent = nullptr);

    // Fills the list for an editor number: 1 persons, 2, 53, 55 companies, 3 companies in the
    // person format, 17 persons and then companies.
    void set_company_data(VDRDocument* document, int editorNumber);
    VDRDocument* document() const { return m_document; }
    int editorNumber() const { return m_editorNumber; }

    // The id of the item whose text is the current text; 0 for an empty text, -1 when none matches.
    int currentCompanyId() const;
    void setCurrentCompanyId(int id);

    // A company as the cell of a report shows it for an editor number; empty when unknown.
    static QString companyText(VDRDocument* document, int companyId, int editorNumber);

public slots:
    void slot_selectedCompanyChanged(int index);
    void slot_selectedPersonChanged(int index);
    void slot_selectedEntryChanged(int index);

signals:
    void companyChosen(int id);

private slots:
    void slotActivated(int index);

private:
    enum Format
    {
        CompanyFormat = 1,
        PersonFormat = 2
    };
    void addRows(VDRSqlTableModel* model, Format format);
    static QString formatCompany(VDRSqlTableModel* model, int row, Format format);
    // The company dialog: true when accepted, with its values; 'mode' 1 company, 2 person, 3 either.
    bool askNewCompany(int mode, QString* company, QString* name, QString* type, int* chosenMode);
    void newCompany();

    VDRDocument* m_document = nullptr;
    int m_editorNumber = 0;
};
