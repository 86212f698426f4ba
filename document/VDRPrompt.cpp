#include "document/VDRPrompt.h"

#include <QDebug>

namespace {

// Used before any front end installs its own: logs and takes the cancelling choice.
class LoggingPrompt : public VDRPrompt
{
public:
    void message(Kind, const QString& title, const QString& text) override
    {
        qWarning().noquote() << title + ": " + text;
    }
    StandardButton question(Kind, const QString& title, const QString& text, StandardButtons, StandardButton,
                            StandardButton escape) override
    {
        qWarning().noquote() << title + ": " + text;
        return escape;
    }
    int choose(Kind, const QString& title, const QString& text, const QStringList&, int, int escapeIndex,
               const QString&, bool*) override
    {
        qWarning().noquote() << title + ": " + text;
        return escapeIndex;
    }
    QString openFileName(const QString&, const QString&, const QString&) override { return {}; }
    QString saveFileName(const QString&, const QString&, const QString&) override { return {}; }
    QString existingDirectory(const QString&, const QString&) override { return {}; }
    void beginNotice(const QString&, const QString&) override {}
    void endNotice() override {}
    void setBusy(bool) override {}
};

LoggingPrompt g_loggingPrompt;
VDRPrompt* g_prompt = nullptr;

} // namespace

int VDRPrompt::s_shown = 0;

VDRPrompt::~VDRPrompt() = default;

VDRPrompt* VDRPrompt::instance()
{
    return g_prompt ? g_prompt : &g_loggingPrompt;
}

void VDRPrompt::setInstance(VDRPrompt* prompt)
{
    g_prompt = prompt;
}
