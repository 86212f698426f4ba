#pragma once

#include "document/VDRDocument.h"
#include "editing/form/VDRRegisterNames.h"

#include <QDate>
#include <QPointer>
#include <QVector>
#include <QWidget>

#include <memory>

class QCheckBox;
class QLabel;
class QLineEdit;
class QPushButton;
class QTabWidget;
class VDRCompleterLineEdit;
class VDRDataWidgetMapper;
class VDRDateEdit;
class VDRRichTextEdit;
class VDRSpellChecker;
class VDRTableView;
class VDRTimeEdit;

// The report form: one report at a time, its head fields, formatted texts and sub-tables on eight
// tabs. The widgets are built once; showing another report binds them to that report's models.
class VDREntryWidget : public QWidget
{
    Q_OBJECT
public:
    explicit VDREntryWidget(QWidget* parent = nullptr, VDRSpellChecker* checker = nullptr);
    ~VDREntryWidget() override;

    VDRDocument* document() const { return m_document; }
    int currentRow() const { return m_row; }
    // The id of the report shown, 0 when none.
    int currentEntryId() const { return m_entryId; }
    bool isDirty() const { return m_dirty; }
    bool is_not_first() const;
    bool is_not_last() const;
    QString headLine() const;
    QTabWidget* tabWidget() const { return m_tabs; }
    VDRTableView* view(const QString& objectName) const;
    const QVector<VDRTableView*>& views() const { return m_views; }
    static QString registerName(VDRRegisterNames::RegisterNames index);
    // The number a new report will get with the index letter (0 none, 1 "a" ... 26 "z").
    static QString numberWithIndex(const QString& number, int index);

    // Insert and renumber with a number already chosen; the dialogs end here.
    bool insertWithNumber(const QString& number, int index);
    bool alterNumberTo(const QString& number, int index);

public slots:
    void slotDocumentOpened(VDRDocument* document);
    void slotDocumentClosed(VDRDocument* document);
    void actionGoto(int row, int tab = -1);
    void actionToFirst();
    void actionToPrevious();
    void actionToNext();
    void actionToLast();
    bool actionGotoNumber(const QString& number);
    bool actionGotoDate(const QDate& date);
    void actionNew();
    void actionInsert();
    void actionCopy();
    void actionDelete();
    void actionSubmit();
    void actionRevert();
    // Saves pending edits (also those still in a field being typed in) into the working copy.
    // True when there were some.
    bool actionAskForSubmit();
    void on_pushButtonFinish_clicked();
    void on_pushButtonRevert_clicked();
    void actionAlterNumber();
    void actionSettingsChangeUID();
    void actionEntryChangeUID();
    void enableGui(bool enable);
    void updateGui();
    void updateGuiWorkforceCount();
    void setSyncButtonVisible(bool visible);
    void setSpellChecker(VDRSpellChecker* checker);

signals:
    void currentRowChanged(int row);
    void displayPhotos1(int);
    void displayPhotos2(int);
    void displayPhotos3(int);
    void displayPhotos4(int);
    void displayPhotos5(int);
    void doOpenHelp(int tab);

protected:
    bool event(QEvent* event) override;

private slots:
    void dataChangedHandler(const QModelIndex& topLeft, const QModelIndex& bottomRight);
    void slotEnlarge(VDRRichTextEdit* edit);

private:
    void buildLayout();
    void AddMappings();
    void RemoveMappings();
    void connectModels(bool on);
    void setupViews();
    void showNone();
    void sendSelectRow();
    bool isLocked() const;
    int rowOfNumber(const QString& numberText, int exceptRow) const;
    // Asks for the number use found in the predecessor file; false when refused.
    bool externalNumberAccepted(const QString& number) const;
    void storeNumber(int row, const QString& number);
    QString askUserId(const QString& title, const QString& text, const QString& preset, bool* ok);
    // Open table editors and the field being typed in hand their text to the models.
    void commitEditors();

    QPointer<VDRDocument> m_document;
    VDRDataWidgetMapper* m_mapper = nullptr;
    int m_row = -1;
    int m_entryId = 0;
    bool m_dirty = false;
    std::unique_ptr<VDRDocument::EntryModelsPin> m_pin;
    VDRSpellChecker* m_checker;

    QLabel* m_headLine;
    QTabWidget* m_tabs;
    VDRDateEdit* m_date;
    VDRTimeEdit* m_timeFrom;
    VDRTimeEdit* m_timeTo;
    VDRTimeEdit* m_envTime;
    VDRCompleterLineEdit* m_weather[3];
    QLineEdit* m_temperature;
    QLineEdit* m_humidity;
    VDRRichTextEdit* m_rich[5];
    QCheckBox* m_sample;
    QCheckBox* m_printTelephone;
    QCheckBox* m_printNotice;
    QLabel* m_workforceCount;
    QPushButton* m_finish;
    QPushButton* m_sync;
    QPushButton* m_save;
    QPushButton* m_revert;
    QPushButton* m_audio;
    QVector<VDRTableView*> m_views;
    QVector<QPointer<VDRSqlTableModel>> m_models;
};
