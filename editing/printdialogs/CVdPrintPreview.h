#pragma once

#include <QDialog>
#include <QStringList>

class QLabel;
class QScrollArea;

// Shows the page images of a preview one at a time; removes them when it closes.
class CVdPrintPreview : public QDialog
{
    Q_OBJECT
public:
    CVdPrintPreview(QWidget* parent, const QStringList& pictureFiles);
    ~CVdPrintPreview() override;

    void display(int page);
    int currentPage() const { return m_page; }

public slots:
    void next();
    void previous();

protected:
    void showEvent(QShowEvent* event) override;

private:
    QStringList m_files;
    int m_page = -1;
    QScrollArea* m_scroll;
    QLabel* m_image;
    QLabel* m_label;
};
