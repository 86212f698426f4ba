#include "editing/time/VDRDateEdit.h"

#include "document/VDRPrompt.h"

#include <QCalendarWidget>
#include <QPointer>
#include <QTimer>
#include <QToolButton>

VDRDateEdit::VDRDateEdit(QWidget* parent) : QLineEdit(parent), m_button(new QToolButton(this))
{
    // A date needs no more; a huge paste is cut here instead of being parsed.
    setMaxLength(64);
    m_button->setText(QStringLiteral("…"));
    m_button->setToolTip(tr("Datum auswählen"));
    m_button->setCursor(Qt::ArrowCursor);
    m_button->setFocusPolicy(Qt::NoFocus);
    connect(m_button, &QToolButton::clicked, this, &VDRDateEdit::slotOpenCalendar);
}

QDate VDRDateEdit::parse(const QString& text)
{
    const QString trimmed = text.trimmed();
    QDate date = QDate::fromString(trimmed, QStringLiteral("d.M.yy"));
    if (!date.isValid())
        date = QDate::fromString(trimmed, QStringLiteral("d.M.yyyy"));
    if (date.isValid() && date.year() < 2000)
        date = date.addYears(100);
    return date;
}

QDate VDRDateEdit::date2() const
{
    return parse(text());
}

QDate VDRDateEdit::date()
{
    QDate result = date2();
    if (result.isValid())
        return result;
    result = QDate::currentDate();
    setDate(result);
    // Shown after the caller (a delegate writing back, a mapper committing) has finished.
    QTimer::singleShot(0, [] {
        VDRPrompt::warning(
            tr("Format-Fehler"),
            tr("Das eingegebene Datum ist nicht korrekt. Bitte verwenden Sie das Format TT.MM.JJJJ!"));
    });
    return result;
}

void VDRDateEdit::setDate(const QDate& date)
{
    setText(date.isValid() ? date.toString(QStringLiteral("dd.MM.yyyy")) : QString());
}

void VDRDateEdit::resizeEvent(QResizeEvent* event)
{
    QLineEdit::resizeEvent(event);
    const int side = height();
    m_button->setGeometry(width() - side, 0, side, side);
    setTextMargins(0, 0, side, 0);
}

void VDRDateEdit::slotOpenCalendar()
{
    auto* calendar = new QCalendarWidget(this);
    calendar->setWindowFlags(Qt::Popup);
    calendar->setAttribute(Qt::WA_DeleteOnClose);
    const QDate current = date2();
    if (current.isValid())
        calendar->setSelectedDate(current);
    QPointer<VDRDateEdit> self(this);
    connect(calendar, &QCalendarWidget::clicked, calendar, [self, calendar](const QDate& picked) {
        if (self) {
            self->setDate(picked);
            self->setModified(true);
            emit self->editingFinished();
        }
        calendar->close();
    });
    calendar->move(mapToGlobal(QPoint(0, height())));
    calendar->show();
}
