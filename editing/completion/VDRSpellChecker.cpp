#include "editing/completion/VDRSpellChecker.h"

#include "document/VDRPrompt.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QSettings>
#include <QTextCodec>

#include <hunspell/hunspell.hxx>

#include <new>

namespace {

const char* const activeKey = "spellCheckerActive";

// Hunspell refuses a .dic whose first line is not a positive word count; it only says so on
// stderr, so the file is looked at before handing it over.
bool readable(const QString& path, bool dicHeader)
{
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly))
        return false;
    if (!dicHeader)
        return true;
    QByteArray first = file.readLine().trimmed();
    if (first.startsWith("\xEF\xBB\xBF"))
        first = first.mid(3);
    bool ok = false;
    return first.toInt(&ok) > 0 && ok;
}

QTextCodec* codecFor(const std::string& encoding)
{
    QByteArray name = QByteArray::fromStdString(encoding);
    // Hunspell's names for the Windows code pages.
    if (name.startsWith("microsoft-cp"))
        name = "windows-" + name.mid(12);
    return QTextCodec::codecForName(name);
}

} // namespace

VDRSpellChecker::VDRSpellChecker(const QString& dictionaryBase, const QString& userDictionary)
    : m_dictionaryBase(dictionaryBase), m_userDictionary(userDictionary)
{
    m_active = QSettings().value(QLatin1String(activeKey), true).toBool();
    if (load())
        loadUserDictionary();
}

VDRSpellChecker::~VDRSpellChecker() = default;

bool VDRSpellChecker::load()
{
    const QString dic = m_dictionaryBase + QLatin1String(".DIC");
    const QString aff = m_dictionaryBase + QLatin1String(".AFF");
    for (const QString& file : {dic, aff}) {
        if (!QFileInfo::exists(file)) {
            VDRPrompt::critical(
                tr("Fehler"), tr("Wörterbuch-Datei %1 exisitert nicht.").arg(QDir::toNativeSeparators(file)));
            return false;
        }
    }
    const QString initError =
        tr("Fehler beim Initialisieren des Moduls Rechtschreibprüfung. Bitte kontaktieren Sie den "
           "Softwarehersteller.");
    if (!readable(aff, false) || !readable(dic, true)) {
        VDRPrompt::critical(tr("Fehler"), initError);
        return false;
    }
    std::unique_ptr<Hunspell> hunspell;
    try {
        hunspell = std::make_unique<Hunspell>(QFile::encodeName(aff).constData(),
                                              QFile::encodeName(dic).constData());
    } catch (const std::bad_alloc&) {
        VDRPrompt::critical(tr("Fehler"),
                            tr("Speicherfehler beim Anlegen des Moduls Rechtschreibprüfung. Bitte "
                               "kontaktieren Sie den Softwarehersteller."));
        return false;
    }
    // Words must travel in the dictionary's own encoding, else umlauts never match.
    m_codec = codecFor(hunspell->get_dict_encoding());
    if (!m_codec) {
        VDRPrompt::critical(tr("Fehler"), initError);
        return false;
    }
    m_hunspell = std::move(hunspell);
    return true;
}

void VDRSpellChecker::loadUserDictionary()
{
    QFile file(m_userDictionary);
    if (!file.open(QIODevice::ReadOnly | QIODevice::Text))
        return; // none yet: created with the first word
    const QStringList lines = QString::fromUtf8(file.readAll()).split(QLatin1Char('\n'));
    for (const QString& line : lines) {
        const QString word = line.trimmed();
        if (word.isEmpty() || m_userWords.contains(word) || !encodable(word))
            continue;
        m_hunspell->add(encode(word));
        m_userWords.insert(word);
    }
}

void VDRSpellChecker::setActive(bool active)
{
    m_active = active;
    QSettings().setValue(QLatin1String(activeKey), active);
}

bool VDRSpellChecker::encodable(const QString& word) const
{
    return m_codec && m_codec->canEncode(word);
}

std::string VDRSpellChecker::encode(const QString& word) const
{
    return m_codec->fromUnicode(word).toStdString();
}

bool VDRSpellChecker::isCorrect(const QString& input) const
{
    const QString word = input.trimmed();
    if (!isActive() || word.isEmpty())
        return true;
    // A character the dictionary cannot even spell is no word of it.
    if (!encodable(word))
        return false;
    return m_hunspell->spell(encode(word));
}

QStringList VDRSpellChecker::suggestions(const QString& word) const
{
    QStringList result;
    if (!isActive() || !encodable(word))
        return result;
    for (const std::string& s : m_hunspell->suggest(encode(word)))
        result << m_codec->toUnicode(s.data(), int(s.size()));
    return result;
}

bool VDRSpellChecker::addToUserDictionary(const QString& input)
{
    const QString word = input.trimmed();
    if (!isValid() || word.isEmpty() || word.contains(QLatin1Char('\n')) ||
        word.contains(QLatin1Char('\r')) || !encodable(word))
        return false;
    if (m_userWords.contains(word))
        return true;
    m_hunspell->add(encode(word));
    m_userWords.insert(word);

    QFile file(m_userDictionary);
    if (!file.open(QIODevice::ReadWrite))
        return false;
    // A list edited by hand may lack the final line break.
    QByteArray line = word.toUtf8() + '\n';
    if (file.size() > 0 && file.seek(file.size() - 1) && file.peek(1) != "\n")
        line.prepend('\n');
    return file.seek(file.size()) && file.write(line) == line.size() && file.flush();
}

QString VDRSpellChecker::dictionarySuffix(QLocale::Language language, QLocale::Country country)
{
    switch (language) {
    case QLocale::English:
        return country == QLocale::UnitedStates ? QStringLiteral("USA") : QStringLiteral("EN");
    case QLocale::Spanish:
        return QStringLiteral("ES");
    default:
        return QStringLiteral("DE"); // German, and the fallback for languages not served
    }
}

QString VDRSpellChecker::translationLanguage(QLocale::Language language, QLocale::Country country)
{
    return dictionarySuffix(language, country).toLower();
}
