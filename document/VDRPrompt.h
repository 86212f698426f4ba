#pragma once

#include <QString>
#include <QStringList>

// The one channel through which code below the window talks to the user: message boxes,
// questions, file dialogs and the busy cursor. The window, the tests and the command-line
// tool each install their own implementation, so the core never opens a dialog itself.
class VDRPrompt
{
public:
    // Values match QMessageBox::StandardButton so the window's implementation can pass them on.
    enum StandardButton
    {
        NoButton = 0x00000000,
        Ok = 0x00000400,
        Save = 0x00000800,
        Open = 0x00002000,
        Yes = 0x00004000,
        No = 0x00010000,
        Abort = 0x00040000,
        Retry = 0x00080000,
        Ignore = 0x00100000,
        Close = 0x00200000,
        Cancel = 0x00400000,
        Discard = 0x00800000,
    };
    Q_DECLARE_FLAGS(StandardButtons, StandardButton)

    enum Kind
    {
        Information,
        Warning,
        Critical,
        Question
    };

    virtual ~VDRPrompt();

    // The process-wide instance; a silent one that only logs is installed until someone sets another.
    static VDRPrompt* instance();
    // Does not take ownership.
    static void setInstance(VDRPrompt* prompt);

    virtual void message(Kind kind, const QString& title, const QString& text) = 0;

    // A question with standard buttons; returns the button chosen. 'escape' is the cancelling
    // answer, 'defaultButton' the affirmative default.
    virtual StandardButton question(Kind kind, const QString& title, const QString& text,
                                    StandardButtons buttons, StandardButton defaultButton,
                                    StandardButton escape) = 0;

    // A question with named buttons and an optional check box; returns the index of the button chosen.
    // 'checked' (may be null) carries the check box state in and out; no check box when checkBoxText is
    // empty.
    virtual int choose(Kind kind, const QString& title, const QString& text, const QStringList& buttons,
                       int defaultIndex, int escapeIndex, const QString& checkBoxText = QString(),
                       bool* checked = nullptr) = 0;

    virtual QString openFileName(const QString& title, const QString& dir, const QString& filter) = 0;
    virtual QString saveFileName(const QString& title, const QString& dir, const QString& filter) = 0;
    virtual QString existingDirectory(const QString& title, const QString& dir) = 0;

    // A box without buttons shown during long work; endNotice() closes it.
    virtual void beginNotice(const QString& title, const QString& text) = 0;
    virtual void endNotice() = 0;
    // How far the work of the open notice has come, 0 to 100.
    virtual void noticeProgress(int percent) { Q_UNUSED(percent) }
    // Replaces the text of the open notice (a running count, say).
    virtual void noticeText(const QString& text) { Q_UNUSED(text) }

    // Nesting busy cursor.
    virtual void setBusy(bool busy) = 0;

    // Shorthands.
    static void information(const QString& title, const QString& text) { shown(Information, title, text); }
    static void warning(const QString& title, const QString& text) { shown(Warning, title, text); }
    static void critical(const QString& title, const QString& text) { shown(Critical, title, text); }
    // How many messages the shorthands have shown: a caller that reports a failure in general
    // terms stays silent when the failing code already explained it (one problem, one message).
    static int messagesShown() { return s_shown; }

private:
    static void shown(Kind kind, const QString& title, const QString& text)
    {
        ++s_shown;
        instance()->message(kind, title, text);
    }
    static int s_shown;
};

Q_DECLARE_OPERATORS_FOR_FLAGS(VDRPrompt::StandardButtons)

// Restores the normal cursor on every way out of a scope.
class VDRBusyCursor
{
public:
    VDRBusyCursor() { VDRPrompt::instance()->setBusy(true); }
    ~VDRBusyCursor() { VDRPrompt::instance()->setBusy(false); }
    VDRBusyCursor(const VDRBusyCursor&) = delete;
    VDRBusyCursor& operator=(const VDRBusyCursor&) = delete;
};
