#pragma once

#include <QDialog>
#include <QList>
#include <QPointer>

class AllCompanyModel;
class QCheckBox;
class QComboBox;
class QGroupBox;
class QLineEdit;
class QPushButton;
class QTabWidget;
class QTableView;
class QTextEdit;
class VDRCompleterTextEdit;
class VDRDocument;
class VDRSpellChecker;
class VDRSqlTableModel;
class VDRTableView;

// The master data of a diary in one modal dialog: the project data (the vdr row), the two company
// lists and the company output formats. Nothing reaches the diary before OK.
class VDRProjectDataWidget : public QDialog
{
    Q_OBJECT
public:
    enum SettingsType
    {
        ST_PROJECTDATA = 0,
        ST_COMPANYLIST = 1,
        ST_COMPANYFORMAT = 2
    };
    Q_ENUM(SettingsType)

    explicit VDRProjectDataWidget(QWidget* parent = nullptr, VDRSpellChecker* checker = nullptr);
    ~VDRProjectDataWidget() override;

    static QString company1ColumnWidthsSettingsKey()
    {
        return QStringLiteral("Geometries/ProjectData/Company1ColumnWidths");
    }
    static QString company2ColumnWidthsSettingsKey()
    {
        return QStringLiteral("Geometries/ProjectData/Company2ColumnWidths");
    }
    // The example company of the format tab, by field name.
    static QMap<QString, QString> createExampleCompany();

    void activateTab(SettingsType type);
    void setPrintButtonVisible(bool visible);
    void countCompanyEntries(int& persons, int& companies) const;
    VDRTableView* tableViewCompanies1() const { return m_table1; }
    VDRTableView* tableViewCompanies2() const { return m_table2; }

public slots:
    void slotDocumentOpened(VDRDocument* document);
    void slotDocumentClosed(VDRDocument* document);
    bool actionSubmit();
    void actionRevert();
    void updateAllCompanyModel();
    void accept() override;
    void reject() override;

    void slot_updateCompanyOutputFormat1FieldIdx1(int index);
    void slot_updateCompanyOutputFormat1FieldIdx2(int index);
    void slot_updateCompanyOutputFormat1FieldIdx3(int index);
    void slot_updateCompanyOutputFormat1Field2InBrackets(bool on);
    void slot_updateCompanyOutputFormat1Field3InBrackets(bool on);
    void slot_updateCompanyOutputFormat2FieldIdx1(int index);
    void slot_updateCompanyOutputFormat2FieldIdx2(int index);
    void slot_updateCompanyOutputFormat2FieldIdx3(int index);
    void slot_updateCompanyOutputFormat2FieldIdx4(int index);
    void slot_updateCompanyOutputFormat2Field3InBrackets(bool on);
    void slot_updateCompanyOutputFormat2Field4InBrackets(bool on);
    void on_pbFormat1Defaults_clicked();
    void on_pbFormat2Defaults_clicked();
    void sl_printProjectData();
    void sl_importCompanyData();

    void slotAddCompany1();
    void slotAddCompany2();
    void slotRemoveCompany1();
    void slotRemoveCompany2();

signals:
    // The printing and the company import live above this dialog; they listen here.
    void printProjectDataRequested();
    void importCompanyDataRequested();

protected:
    void showEvent(QShowEvent* event) override;

private:
    QWidget* createProjectTab();
    QWidget* createCompanyTab();
    QWidget* createFormatTab();
    void readVdrRow();
    bool writeVdrRow();
    void restoreCompanyOutputFormat1Settings();
    void restoreCompanyOutputFormat2Settings();
    void saveCompanyOutputFormat1Settings();
    void saveCompanyOutputFormat2Settings();
    void restoreCompanyColumnWidths();
    void storeCompanyColumnWidths();
    void updateFormatWidgets();
    void updateExamples();
    void setCompanyModels();
    void removeSelectedRows(QTableView* view);
    void showAllRows();
    void hideRemovedRows(QTableView* view);

    QPointer<VDRDocument> m_document;
    VDRSpellChecker* m_checker;
    AllCompanyModel* m_allCompanyModel = nullptr;
    bool m_printWanted = true;

    QTabWidget* m_tabs = nullptr;
    QLineEdit* m_name = nullptr;
    QLineEdit* m_number = nullptr;
    QLineEdit* m_headline[3] = {};
    QLineEdit* m_footer[3] = {};
    QCheckBox* m_emptyCategories = nullptr;
    QList<QCheckBox*> m_showFlags; // in the order of showColumns()
    QTextEdit* m_projectAddress = nullptr;
    VDRCompleterTextEdit* m_projectDescription = nullptr;
    QCheckBox* m_showAddress[3] = {};
    QComboBox* m_address[3] = {};
    VDRTableView* m_table1 = nullptr;
    VDRTableView* m_table2 = nullptr;
    QPushButton* m_print = nullptr;
    QPushButton* m_import = nullptr;

    // Format tab: the choices stay here until OK.
    QComboBox* m_format1Field[3] = {};
    QCheckBox* m_format1Brackets[2] = {};
    QLineEdit* m_format1Example = nullptr;
    QComboBox* m_format2Field[4] = {};
    QCheckBox* m_format2Brackets[2] = {};
    QLineEdit* m_format2Example = nullptr;
    int m_f1[3] = {0, 4, 1};
    bool m_f1Brackets[2] = {false, true};
    int m_f2[4] = {0, 3, 4, 1};
    bool m_f2Brackets[2] = {false, true};
};
