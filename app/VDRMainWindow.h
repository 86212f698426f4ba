#pragma once

#include <QMainWindow>

class QLabel;
class QTableView;
class VDRDocument;

// The main window. For now it creates or opens one diary and shows its reports; menus, docks
// and the report form come with the full window.
class VDRMainWindow : public QMainWindow
{
    Q_OBJECT
public:
    explicit VDRMainWindow(QWidget* parent = nullptr);
    ~VDRMainWindow() override;

    VDRDocument* document() const { return m_document; }

    // 0 = opened, 2 = cancelled or failed.
    int openDocument(const QString& path);
    bool createDocument();
    bool closeDocument();

protected:
    void closeEvent(QCloseEvent* event) override;

private slots:
    void slotDocumentOpened();
    void slotDocumentClosed();

private:
    VDRDocument* m_document;
    QLabel* m_projectLabel;
    QTableView* m_reports;
};

extern VDRMainWindow* g_mainWindow;
