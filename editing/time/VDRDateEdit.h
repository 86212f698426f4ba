#pragma once

#include <QDate>
#include <QLineEdit>

class QToolButton;

// A date typed as "d.M.yy" or "d.M.yyyy" and shown as "dd.MM.yyyy", with a popup calendar.
class VDRDateEdit : public QLineEdit
{
    Q_OBJECT
    Q_PROPERTY(QDate date READ date WRITE setDate USER true)
public:
    explicit VDRDateEdit(QWidget* parent = nullptr);

    // The entered date; an unreadable text becomes today's date, with a warning once back in the
    // event loop.
    QDate date();
    // The entered date, or a null date when the text cannot be read; changes nothing.
    QDate date2() const;
    void setDate(const QDate& date);
    QToolButton* calendarButton() const { return m_button; }
    static QDate parse(const QString& text);

protected:
    void resizeEvent(QResizeEvent* event) override;

private slots:
    void slotOpenCalendar();

private:
    QToolButton* m_button;
};
