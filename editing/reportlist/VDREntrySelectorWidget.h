#pragma once

#include <QDialog>
#include <QList>

class QButtonGroup;
class QLabel;
class QLineEdit;
class VDRDocument;

// Chooses the reports a print, PDF or mail run covers: all, the locked ones, the drafts, the
// current one, or a range of numbers.
class VDREntrySelectorWidget : public QDialog
{
    Q_OBJECT
public:
    enum Mode
    {
        NoMode = 0,
        AllEntries = 1,
        LockedEntries = 2,
        DraftEntries = 3,
        CurrentEntry = 4,
        NumberRange = 5
    };
    // What closed the dialog (QDialog::exec() returns it).
    enum Result
    {
        Cancelled = 0,
        Ok = 1,
        Pdf = 2,
        Print = 3
    };

    explicit VDREntrySelectorWidget(int mode, QWidget* parent = nullptr);

    int getSelectedMode() const;
    void setSelectedMode(int mode);
    QString getSelectionMode5From() const;
    QString getSelectionMode5To() const;
    void setSelectionMode5From(const QString& number);
    void setSelectionMode5To(const QString& number);
    void setLabelText(const QString& text);
    // With a document, a choice that covers no report is refused with a message.
    void setDocument(VDRDocument* document, int currentRow);

    // The ids of the reports a mode covers, in row order; -1 as current row for none.
    static QList<int> entryIds(VDRDocument* document, int mode, int currentRow,
                               const QString& from = QString(), const QString& to = QString());
    // The PDF file name proposed for the reports chosen ('ids' as entryIds returned them).
    static QString pdfFileName(VDRDocument* document, int mode, const QList<int>& ids);

private:
    void finish(int result);

    QButtonGroup* m_modes;
    QLabel* m_label;
    QLineEdit* m_from;
    QLineEdit* m_to;
    VDRDocument* m_document = nullptr;
    int m_currentRow = -1;
};
