#pragma once

#include <QWidget>

class QToolButton;
class VDRDocument;
class VDRIntModel;
class VDRTableView;
class VDRTextEditComboBoxListView;
class VDRTextEditComboBoxTextEdit;

// An editable text with a drop-down list of (text, id) entries: picking an entry sets the text
// and the current id; typing keeps the id only while the text matches an entry.
class VDRTextEditComboBox : public QWidget
{
    Q_OBJECT
public:
    VDRTextEditComboBox(VDRTableView* view, QWidget* parent = nullptr, bool frame = false);

    void addItem(const QString& text, int id);
    void setText(const QString& text);
    void setCurrentId(int id);
    void setCurrentId(const QString& text);
    int currentId() const { return m_currentId; }
    QString currentText() const;
    void setDocument(VDRDocument* document) { m_document = document; }
    VDRIntModel* model() const { return m_model; }
    VDRTextEditComboBoxTextEdit* textEdit() const { return m_edit; }
    VDRTextEditComboBoxListView* listView() const { return m_list; }
    void showList();

signals:
    void currentIdChanged(int id);
    // An entry of the list was chosen.
    void picked(int id);

private slots:
    void slotTextChanged();
    void slotPicked(int row);

private:
    VDRTableView* m_view;
    VDRDocument* m_document = nullptr;
    VDRIntModel* m_model;
    VDRTextEditComboBoxTextEdit* m_edit;
    VDRTextEditComboBoxListView* m_list;
    QToolButton* m_button;
    int m_currentId = -1;
    bool m_settingText = false;
};
