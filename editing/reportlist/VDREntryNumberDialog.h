#pragma once

#include <QDialog>

class QLabel;
class QSpinBox;
class QSpinBoxLetter;
class VDRDocument;
class VDREntryNumber;

// Asks for a report number and an optional letter index; the number has the diary's digit count.
class VDREntryNumberDialog : public QDialog
{
    Q_OBJECT
public:
    VDREntryNumberDialog(VDRDocument* document, QWidget* parent = nullptr);
    // The diary is the one the window around 'parent' holds (3 digits when there is none).
    explicit VDREntryNumberDialog(QWidget* parent);

    // The number left-padded with "0" to the diary's digit count.
    QString getEntryNumber() const;
    // 'a' to 'z', or 0 without a letter.
    char getEntryLetter() const;
    // Takes the leading digits of a number text ("012a (Entwurf)" presets 12).
    void setEntryNumber(const QString& number);
    // Number and letter index of a report's number.
    void setEntry(const VDREntryNumber& number);
    // 0 or a letter 'a' to 'z' (upper case counts the same); anything else clears the letter.
    void setEntryLetter(char letter);
    int digits() const { return m_digits; }

protected:
    VDREntryNumberDialog(VDRDocument* document, const QString& text, QWidget* parent);
    static VDRDocument* documentAround(QWidget* widget);

private:
    int m_digits;
    QSpinBox* m_number;
    QSpinBoxLetter* m_letter;
};
