#pragma once

#include <QDialog>
#include <QFont>

class QLabel;

// The printout fonts: header, captions, body and footer, each with a sample line.
class CVdConfigDialog : public QDialog
{
    Q_OBJECT
public:
    explicit CVdConfigDialog(QWidget* parent = nullptr);

    QFont headerFont, titleFont, contentsFont, footerFont;

public slots:
    void header_clicked();
    void title_clicked();
    void contents_clicked();
    void footer_clicked();
    void defaults_clicked();
    void accept() override;

private:
    void chooseFont(QFont& font);
    void showSamples();
    QLabel* m_samples[4];
};
