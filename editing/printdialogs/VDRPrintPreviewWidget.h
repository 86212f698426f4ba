#pragma once

#include <QList>
#include <QString>
#include <QWidget>

class QLabel;
class QPushButton;
class VDRPrintPreviewA4PageWidget;

// Pages recorded as picture files, shown one at a time with previous and next.
class VDRPrintPreviewWidget : public QWidget
{
    Q_OBJECT
public:
    explicit VDRPrintPreviewWidget(QWidget* parent = nullptr);

    void setPreviewFiles(const QList<QString>& files);
    int pageCount() const { return m_files.size(); }
    int currentPage() const { return m_page; }

public slots:
    // Ignores pages outside the list.
    void displayPage(int page);
    void nextPage() { displayPage(m_page + 1); }
    void previousPage() { displayPage(m_page - 1); }

private:
    void updateButtons();

    QList<QString> m_files;
    int m_page = -1;
    VDRPrintPreviewA4PageWidget* m_sheet;
    QLabel* m_label;
    QPushButton* m_previous;
    QPushButton* m_next;
};
