#pragma once

#include "document/VDRPrompt.h"

#include <QPointer>
#include <QProgressDialog>

class QMessageBox;
class QWidget;

// The window's prompt: message boxes, file dialogs and the override cursor.
class VDRWidgetPrompt : public VDRPrompt
{
public:
    void setParentWidget(QWidget* parent) { m_parent = parent; }

    void message(Kind kind, const QString& title, const QString& text) override;
    StandardButton question(Kind kind, const QString& title, const QString& text, StandardButtons buttons,
                            StandardButton defaultButton, StandardButton escape) override;
    int choose(Kind kind, const QString& title, const QString& text, const QStringList& buttons,
               int defaultIndex, int escapeIndex, const QString& checkBoxText, bool* checked) override;
    QString openFileName(const QString& title, const QString& dir, const QString& filter) override;
    QString saveFileName(const QString& title, const QString& dir, const QString& filter) override;
    QString existingDirectory(const QString& title, const QString& dir) override;
    void beginNotice(const QString& title, const QString& text) override;
    void endNotice() override;
    void noticeProgress(int percent) override;
    void noticeText(const QString& text) override;
    void setBusy(bool busy) override;

private:
    QPointer<QWidget> m_parent;
    QPointer<QProgressDialog> m_notice;
};
