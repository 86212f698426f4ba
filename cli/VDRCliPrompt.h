#pragma once

#include "document/VDRPrompt.h"

// Prints "Title: text" to stderr; questions take the cancelling choice, or the affirmative
// default when the user passed --yes.
class VDRCliPrompt : public VDRPrompt
{
public:
    explicit VDRCliPrompt(bool acceptQuestions) : m_yes(acceptQuestions) {}

    void message(Kind kind, const QString& title, const QString& text) override;
    StandardButton question(Kind kind, const QString& title, const QString& text, StandardButtons buttons,
                            StandardButton defaultButton, StandardButton escape) override;
    int choose(Kind kind, const QString& title, const QString& text, const QStringList& buttons,
               int defaultIndex, int escapeIndex, const QString& checkBoxText, bool* checked) override;
    QString openFileName(const QString&, const QString&, const QString&) override { return {}; }
    QString saveFileName(const QString&, const QString&, const QString&) override { return {}; }
    QString existingDirectory(const QString&, const QString&) override { return {}; }
    void beginNotice(const QString& title, const QString& text) override
    {
        message(Information, title, text);
    }
    void endNotice() override {}
    // One line per step, so that a long import shows where it is.
    void noticeText(const QString& text) override { message(Information, QString(), text); }
    void setBusy(bool) override {}

private:
    bool m_yes;
};
