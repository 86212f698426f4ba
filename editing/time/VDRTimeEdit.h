#pragma once

#include <QLineEdit>
#include <QTime>

class QToolButton;

// A time typed as "7", "7:5" or "07:05" and shown as "hh:mm", with a button that opens the picker.
class VDRTimeEdit : public QLineEdit
{
    Q_OBJECT
    Q_PROPERTY(QTime time READ time WRITE setTime USER true)
public:
    explicit VDRTimeEdit(QWidget* parent = nullptr);

    // The entered time; the text is rewritten as "hh:mm". An empty or unacceptable text gives a null time.
    QTime time();
    // The entered time, leaving the text as typed.
    QTime time2() const;
    void setTime(const QTime& time);
    QToolButton* pickerButton() const { return m_button; }

protected:
    void resizeEvent(QResizeEvent* event) override;

private slots:
    void slotOpenPicker();

private:
    QToolButton* m_button;
};
