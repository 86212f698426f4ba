#include "cli/VDRCliPrompt.h"

#include <cstdio>

namespace {
void print(const QString& line)
{
    std::fprintf(stderr, "%s\n", line.toLocal8Bit().constData());
    std::fflush(stderr);
}
} // namespace

void VDRCliPrompt::message(Kind, const QString& title, const QString& text)
{
    print(title.trimmed().isEmpty() ? text : title.trimmed() + QStringLiteral(": ") + text);
}

VDRPrompt::StandardButton VDRCliPrompt::question(Kind kind, const QString& title, const QString& text,
                                                 StandardButtons, StandardButton defaultButton,
                                                 StandardButton escape)
{
    message(kind, title, text);
    const StandardButton answer = m_yes ? defaultButton : escape;
    print(QStringLiteral("  -> %1").arg(m_yes ? QStringLiteral("yes (--yes)") : QStringLiteral("cancelled")));
    return answer;
}

int VDRCliPrompt::choose(Kind kind, const QString& title, const QString& text, const QStringList& buttons,
                         int defaultIndex, int escapeIndex, const QString&, bool*)
{
    message(kind, title, text);
    const int answer = m_yes ? defaultIndex : escapeIndex;
    print(QStringLiteral("  -> %1").arg(buttons.value(answer)));
    return answer;
}
