#include "app/VDRMainWindow.h"

#include "document/VDRAllEntryTableModel.h"
#include "document/VDRDocument.h"
#include "document/VDRPrompt.h"

#include <QAction>
#include <QCloseEvent>
#include <QHeaderView>
#include <QLabel>
#include <QMenuBar>
#include <QSqlRecord>
#include <QTableView>
#include <QVBoxLayout>

VDRMainWindow* g_mainWindow = nullptr;

VDRMainWindow::VDRMainWindow(QWidget* parent)
    : QMainWindow(parent), m_document(new VDRDocument(this)), m_projectLabel(new QLabel(this)),
      m_reports(new QTableView(this))
{
    setObjectName(QStringLiteral("VDRMainWindow"));
    setWindowTitle(tr("Varduna"));
    auto* central = new QWidget(this);
    auto* layout = new QVBoxLayout(central);
    layout->addWidget(m_projectLabel);
    layout->addWidget(m_reports);
    setCentralWidget(central);
    m_reports->setEditTriggers(QAbstractItemView::NoEditTriggers);
    m_reports->verticalHeader()->hide();

    QMenu* file = menuBar()->addMenu(tr("Datei"));
    file->setObjectName(QStringLiteral("menuFile"));
    QAction* actionNew = file->addAction(tr("Neu"), this, [this] { createDocument(); });
    actionNew->setObjectName(QStringLiteral("actionFileNew"));
    QAction* actionOpen = file->addAction(tr("Öffnen"), this, [this] {
        const QString path = VDRPrompt::instance()->openFileName(tr("Dokument öffnen"), QString(),
                                                                 tr("Varduna (*.vd2)"));
        if (!path.isEmpty() && openDocument(path) == 2)
            createDocument();
    });
    actionOpen->setObjectName(QStringLiteral("actionFileOpen"));
    file->addSeparator();
    QAction* actionExit = file->addAction(tr("Beenden"), this, &QWidget::close);
    actionExit->setObjectName(QStringLiteral("actionFileExit"));

    connect(m_document, &VDRDocument::documentOpened, this, &VDRMainWindow::slotDocumentOpened);
    connect(m_document, &VDRDocument::documentClosed, this, &VDRMainWindow::slotDocumentClosed);
    slotDocumentClosed();
    resize(900, 600);
}

VDRMainWindow::~VDRMainWindow()
{
    if (g_mainWindow == this)
        g_mainWindow = nullptr;
}

int VDRMainWindow::openDocument(const QString& path)
{
    if (!closeDocument())
        return 2;
    bool showError = true;
    if (!m_document->openDocument(path, showError)) {
        if (showError)
            VDRPrompt::critical(tr("Fehler"), tr("Beim Öffnen des gewählten Dokuments ist ein Fehler aufgetreten!"));
        return 2;
    }
    return 0;
}

bool VDRMainWindow::createDocument()
{
    if (!closeDocument())
        return false;
    if (!m_document->createDocument(true)) {
        VDRPrompt::critical(tr("Fehler"), tr("Beim Erstellen eines neuen Dokuments ist ein Fehler aufgetreten!"));
        return false;
    }
    return true;
}

bool VDRMainWindow::closeDocument()
{
    if (!m_document->isStateValid())
        return true;
    if (!m_document->closeDocument()) {
        VDRPrompt::critical(tr("Fehler"), tr("Beim Schließen des Dokuments ist ein Fehler aufgetreten!"));
        return false;
    }
    return true;
}

void VDRMainWindow::closeEvent(QCloseEvent* event)
{
    if (!closeDocument()) {
        event->ignore();
        return;
    }
    event->accept();
}

void VDRMainWindow::slotDocumentOpened()
{
    const QString file = m_document->isStateNew() ? tr("Neues Dokument") : m_document->getFilepath();
    m_projectLabel->setText(tr("Projekt: %1 (%2)").arg(m_document->projectName(), file));
    m_reports->setModel(m_document->modelEntryAll());
    VDRAllEntryTableModel* model = m_document->modelEntryAll();
    for (int c = 0; c < model->columnCount(); ++c) {
        const QString field = model->record().fieldName(c);
        m_reports->setColumnHidden(c, field != QLatin1String("number") && field != QLatin1String("inspection_date") &&
                                          field != QLatin1String("locked"));
    }
    setWindowTitle(tr("Varduna - %1").arg(file));
}

void VDRMainWindow::slotDocumentClosed()
{
    m_reports->setModel(nullptr);
    m_projectLabel->setText(tr("Kein Dokument geöffnet."));
    setWindowTitle(tr("Varduna"));
}
