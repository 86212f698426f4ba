#pragma once

#include <QCoreApplication>
#include <QLocale>
#include <QSet>
#include <QString>
#include <QStringList>

#include <memory>

class Hunspell;
class QTextCodec;

// Checks words against a hunspell dictionary (base + ".DIC" / ".AFF") and the user's own
// word list (one word per line, UTF-8). A checker whose dictionary could not be loaded stays
// inactive and accepts every word, so text fields can always ask it.
class VDRSpellChecker
{
    Q_DECLARE_TR_FUNCTIONS(VDRSpellChecker)

public:
    // Loads the dictionary and the user's words; failures are shown through the prompt.
    // The on/off state is read from the setting "spellCheckerActive" (default on).
    VDRSpellChecker(const QString& dictionaryBase, const QString& userDictionary);
    ~VDRSpellChecker();
    VDRSpellChecker(const VDRSpellChecker&) = delete;
    VDRSpellChecker& operator=(const VDRSpellChecker&) = delete;

    // True when the dictionary was loaded.
    bool isValid() const { return m_hunspell != nullptr; }
    // True when loaded and switched on.
    bool isActive() const { return isValid() && m_active; }
    // Switches checking on or off and stores the choice in "spellCheckerActive".
    void setActive(bool active);

    // True for words the dictionaries know, and for every word while the checker is inactive.
    bool isCorrect(const QString& word) const;
    // Empty while inactive.
    QStringList suggestions(const QString& word) const;
    // Accepts the word at once and appends it to the user dictionary file (created when missing).
    // Returns false when the word cannot be kept (empty, several lines, not in the dictionary's
    // character set) or the file cannot be written.
    bool addToUserDictionary(const QString& word);

    QString dictionaryBase() const { return m_dictionaryBase; }
    QString userDictionary() const { return m_userDictionary; }

    // Suffix of the dictionary and user dictionary files: "DE", "EN", "ES" or "USA".
    static QString dictionarySuffix(QLocale::Language language,
                                    QLocale::Country country = QLocale::AnyCountry);
    // Language part of the translation files: "de", "en", "es" or "usa".
    static QString translationLanguage(QLocale::Language language,
                                       QLocale::Country country = QLocale::AnyCountry);

private:
    bool load();
    void loadUserDictionary();
    bool encodable(const QString& word) const;
    std::string encode(const QString& word) const;

    QString m_dictionaryBase;
    QString m_userDictionary;
    std::unique_ptr<Hunspell> m_hunspell;
    QTextCodec* m_codec = nullptr;
    QSet<QString> m_userWords;
    bool m_active = true;
};
