#pragma once

#include <QLineEdit>

class QToolButton;
class VDRCompleter;

// A one-line field with a suggestion list: learns its text on editingFinished(), offers the list
// while typing (Ctrl+E always) and through the small button at its right edge.
class VDRCompleterLineEdit : public QLineEdit
{
    Q_OBJECT
public:
    explicit VDRCompleterLineEdit(QWidget* parent = nullptr);

    void setCompleterData(int regIdx, const QString& title, int tableID, const QString& column, int columnID);
    // Builds the list from the data given before; replaces an earlier one.
    void createCompleter();
    // Takes over a list built elsewhere.
    void setOwnCompleter(VDRCompleter* completer);
    VDRCompleter* ownCompleter() const { return m_completer; }
    // Switches suggestions and the button off for this field only.
    void enableCompleter(bool enable);
    QToolButton* listButton() const { return m_button; }

protected:
    void keyPressEvent(QKeyEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

private slots:
    void slotChosen(const QString& display);
    void slotLearn();
    void slotListButton();

private:
    void updateButton();

    VDRCompleter* m_completer = nullptr;
    QToolButton* m_button;
    bool m_enabled = true;
    int m_regIdx = 0;
    QString m_title;
    int m_tableID = 0;
    QString m_column;
    int m_columnID = 0;
};
