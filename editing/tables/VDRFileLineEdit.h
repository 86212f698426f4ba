#pragma once

#include <QLineEdit>

class QToolButton;
class VDRDocument;

// A document name with suggestions from the names the table already holds. Mode 0 also offers a
// button that chooses a file to attach; mode 1 takes names only.
class VDRFileLineEdit : public QLineEdit
{
    Q_OBJECT
public:
    explicit VDRFileLineEdit(int mode, QWidget* parent = nullptr);

    void setCompleterData(VDRDocument* document, int tableID, const QString& column, int columnID);
    int mode() const { return m_mode; }
    QToolButton* fileButton() const { return m_button; }

protected:
    void resizeEvent(QResizeEvent* event) override;

private slots:
    void slotChooseFile();

private:
    int m_mode;
    QToolButton* m_button;
};
