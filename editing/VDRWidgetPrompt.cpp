#include "editing/VDRWidgetPrompt.h"

#include <QApplication>
#include <QCheckBox>
#include <QFileDialog>
#include <QMessageBox>
#include <QPushButton>

namespace {
QMessageBox::Icon iconFor(VDRPrompt::Kind kind)
{
    switch (kind) {
    case VDRPrompt::Information:
        return QMessageBox::Information;
    case VDRPrompt::Warning:
        return QMessageBox::Warning;
    case VDRPrompt::Critical:
        return QMessageBox::Critical;
    case VDRPrompt::Question:
        return QMessageBox::Question;
    }
    return QMessageBox::NoIcon;
}

// A question must show the arrow cursor even while the caller is busy.
class NormalCursor
{
public:
    NormalCursor()
    {
        if (QApplication::overrideCursor()) {
            QApplication::setOverrideCursor(Qt::ArrowCursor);
            m_pushed = true;
        }
    }
    ~NormalCursor()
    {
        if (m_pushed)
            QApplication::restoreOverrideCursor();
    }

private:
    bool m_pushed = false;
};
} // namespace

void VDRWidgetPrompt::message(Kind kind, const QString& title, const QString& text)
{
    NormalCursor cursor;
    QMessageBox box(iconFor(kind), title, text, QMessageBox::Ok, m_parent);
    box.exec();
}

VDRPrompt::StandardButton VDRWidgetPrompt::question(Kind kind, const QString& title, const QString& text,
                                                    StandardButtons buttons, StandardButton defaultButton,
                                                    StandardButton escape)
{
    NormalCursor cursor;
    QMessageBox box(iconFor(kind), title, text, QMessageBox::StandardButtons(int(buttons)), m_parent);
    box.setDefaultButton(QMessageBox::StandardButton(defaultButton));
    box.setEscapeButton(QMessageBox::StandardButton(escape));
    const int result = box.exec();
    return StandardButton(result);
}

int VDRWidgetPrompt::choose(Kind kind, const QString& title, const QString& text, const QStringList& buttons,
                            int defaultIndex, int escapeIndex, const QString& checkBoxText, bool* checked)
{
    NormalCursor cursor;
    QMessageBox box(iconFor(kind), title, text, QMessageBox::NoButton, m_parent);
    QList<QPushButton*> pushButtons;
    for (const QString& label : buttons)
        pushButtons << box.addButton(label, QMessageBox::ActionRole);
    if (defaultIndex >= 0 && defaultIndex < pushButtons.size())
        box.setDefaultButton(pushButtons[defaultIndex]);
    if (escapeIndex >= 0 && escapeIndex < pushButtons.size())
        box.setEscapeButton(pushButtons[escapeIndex]);
    QCheckBox* check = nullptr;
    if (!checkBoxText.isEmpty()) {
        check = new QCheckBox(checkBoxText, &box);
        check->setChecked(checked && *checked);
        box.setCheckBox(check);
    }
    box.exec();
    if (check && checked)
        *checked = check->isChecked();
    const int index = pushButtons.indexOf(static_cast<QPushButton*>(box.clickedButton()));
    return index < 0 ? escapeIndex : index;
}

QString VDRWidgetPrompt::openFileName(const QString& title, const QString& dir, const QString& filter)
{
    NormalCursor cursor;
    return QFileDialog::getOpenFileName(m_parent, title, dir, filter);
}

QString VDRWidgetPrompt::saveFileName(const QString& title, const QString& dir, const QString& filter)
{
    NormalCursor cursor;
    return QFileDialog::getSaveFileName(m_parent, title, dir, filter);
}

QString VDRWidgetPrompt::existingDirectory(const QString& title, const QString& dir)
{
    NormalCursor cursor;
    return QFileDialog::getExistingDirectory(m_parent, title, dir);
}

void VDRWidgetPrompt::beginNotice(const QString& title, const QString& text)
{
    endNotice();
    // A progress box: a message box without buttons refuses to be closed.
    m_notice = new QProgressDialog(text, QString(), 0, 0, m_parent);
    m_notice->setWindowTitle(title);
    m_notice->setCancelButton(nullptr);
    m_notice->setWindowModality(Qt::WindowModal);
    m_notice->setMinimumDuration(0);
    m_notice->setAutoClose(false);
    m_notice->setAutoReset(false);
    m_notice->show();
    QApplication::processEvents(QEventLoop::ExcludeUserInputEvents);
}

void VDRWidgetPrompt::noticeProgress(int percent)
{
    if (!m_notice)
        return;
    m_notice->setRange(0, 100);
    m_notice->setValue(qBound(0, percent, 100));
}

void VDRWidgetPrompt::noticeText(const QString& text)
{
    if (!m_notice)
        return;
    m_notice->setLabelText(text);
    QApplication::processEvents(QEventLoop::ExcludeUserInputEvents);
}

void VDRWidgetPrompt::endNotice()
{
    if (!m_notice)
        return;
    m_notice->hide();
    m_notice->deleteLater();
    m_notice.clear();
}

void VDRWidgetPrompt::setBusy(bool busy)
{
    if (busy)
        QApplication::setOverrideCursor(Qt::WaitCursor);
    else if (QApplication::overrideCursor())
        QApplication::restoreOverrideCursor();
}
