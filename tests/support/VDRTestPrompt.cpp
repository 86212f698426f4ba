#include "VDRTestPrompt.h"

VDRTestPrompt::VDRTestPrompt() : m_previous(VDRPrompt::instance())
{
    VDRPrompt::setInstance(this);
}

VDRTestPrompt::~VDRTestPrompt()
{
    VDRPrompt::setInstance(m_previous);
}

void VDRTestPrompt::expect(const QString& title, const QString& textPart, int answer)
{
    m_expected.append({title, textPart, answer, false});
}

void VDRTestPrompt::expectTicked(const QString& title, const QString& textPart, int answer)
{
    m_expected.append({title, textPart, answer, true});
}

bool VDRTestPrompt::take(const Message& m, int* answer, bool* tick)
{
    messages << m;
    if (!m_expected.isEmpty()) {
        const Expectation& e = m_expected.first();
        if (e.title == m.title && m.text.contains(e.textPart)) {
            *answer = e.answer;
            if (tick)
                *tick = e.tick;
            m_expected.removeFirst();
            return true;
        }
    }
    m_unexpected << QStringLiteral("unexpected message \"%1\": \"%2\"").arg(m.title, m.text);
    return false;
}

bool VDRTestPrompt::verify(QString* report) const
{
    QStringList problems = m_unexpected;
    for (const Expectation& e : m_expected)
        problems << QStringLiteral("expected message \"%1\" (containing \"%2\") never came")
                        .arg(e.title, e.textPart);
    if (report)
        *report = problems.join(QLatin1Char('\n'));
    return problems.isEmpty();
}

void VDRTestPrompt::reset()
{
    messages.clear();
    m_expected.clear();
    m_unexpected.clear();
    m_fileAnswers.clear();
    fileProposals.clear();
}

void VDRTestPrompt::message(Kind kind, const QString& title, const QString& text)
{
    int answer = -1;
    take({kind, title, text, {}}, &answer);
}

VDRPrompt::StandardButton VDRTestPrompt::question(Kind kind, const QString& title, const QString& text,
                                                  StandardButtons, StandardButton, StandardButton escape)
{
    int answer = -1;
    if (!take({kind, title, text, {}}, &answer) || answer < 0)
        return escape;
    return StandardButton(answer);
}

int VDRTestPrompt::choose(Kind kind, const QString& title, const QString& text, const QStringList& buttons,
                          int, int escapeIndex, const QString& checkBoxText, bool* checked)
{
    int answer = -1;
    bool tick = false;
    const bool expected = take({kind, title, text, buttons}, &answer, &tick);
    if (tick && checked && !checkBoxText.isEmpty())
        *checked = true;
    if (!expected || answer < 0)
        return escapeIndex;
    return answer;
}

QString VDRTestPrompt::openFileName(const QString& title, const QString& proposal, const QString&)
{
    fileProposals << proposal;
    if (m_fileAnswers.isEmpty()) {
        m_unexpected << QStringLiteral("unexpected file dialog \"%1\"").arg(title);
        return QString();
    }
    return m_fileAnswers.takeFirst();
}

QString VDRTestPrompt::saveFileName(const QString& title, const QString& dir, const QString& filter)
{
    return openFileName(title, dir, filter);
}

QString VDRTestPrompt::existingDirectory(const QString& title, const QString& dir)
{
    return openFileName(title, dir, QString());
}

void VDRTestPrompt::beginNotice(const QString& title, const QString& text)
{
    message(Information, title, text);
}
