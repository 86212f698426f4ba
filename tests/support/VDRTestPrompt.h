#pragma once

#include "document/VDRPrompt.h"

#include <QList>
#include <QStringList>

// The tests' prompt: records every message and answers from a queue of expectations the test
// sets up. A message nobody expected is recorded as a failure and answered with its cancelling choice.
class VDRTestPrompt : public VDRPrompt
{
public:
    struct Message
    {
        Kind kind;
        QString title;
        QString text;
        QStringList buttons;
    };

    VDRTestPrompt();
    ~VDRTestPrompt() override;

    // Expects a message titled 'title' whose text contains 'textPart'. 'answer' is the button index
    // for named buttons or a StandardButton for standard ones; -1 takes the cancelling choice.
    void expect(const QString& title, const QString& textPart = QString(), int answer = -1);
    // The same, and the question's check box is ticked.
    void expectTicked(const QString& title, const QString& textPart, int answer);
    void expectFileName(const QString& path) { m_fileAnswers << path; }

    // True when every expectation was met and nothing unexpected came; 'report' says what went wrong.
    bool verify(QString* report = nullptr) const;
    void reset();

    QList<Message> messages;
    // What each file dialog proposed (its folder or file name), in order.
    QStringList fileProposals;

    void message(Kind kind, const QString& title, const QString& text) override;
    StandardButton question(Kind kind, const QString& title, const QString& text, StandardButtons buttons,
                            StandardButton defaultButton, StandardButton escape) override;
    int choose(Kind kind, const QString& title, const QString& text, const QStringList& buttons,
               int defaultIndex, int escapeIndex, const QString& checkBoxText, bool* checked) override;
    QString openFileName(const QString& title, const QString&, const QString&) override;
    QString saveFileName(const QString& title, const QString&, const QString&) override;
    QString existingDirectory(const QString& title, const QString&) override;
    void beginNotice(const QString& title, const QString& text) override;
    void endNotice() override {}
    void setBusy(bool busy) override { m_busy += busy ? 1 : -1; }
    int busyDepth() const { return m_busy; }

private:
    struct Expectation
    {
        QString title;
        QString textPart;
        int answer;
        bool tick;
    };
    // Returns the answer of the matching expectation, or records an unexpected message.
    bool take(const Message& m, int* answer, bool* tick = nullptr);

    QList<Expectation> m_expected;
    QStringList m_fileAnswers;
    QStringList m_unexpected;
    int m_busy = 0;
    VDRPrompt* m_previous;
};

#define VDR_VERIFY_PROMPT(prompt)                                                                            \
    do {                                                                                                     \
        QString vdrPromptReport;                                                                             \
        QVERIFY2((prompt).verify(&vdrPromptReport), qPrintable(vdrPromptReport));                            \
    } while (false)
