#include "editing/printdialogs/CVdPrintPreview.h"

#include <QFile>
#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QScrollArea>
#include <QScrollBar>
#include <QVBoxLayout>

CVdPrintPreview::CVdPrintPreview(QWidget* parent, const QStringList& pictureFiles)
    : QDialog(parent), m_files(pictureFiles)
{
    setWindowTitle(tr("Druck-Ansicht"));
    setWindowIcon(QIcon(QStringLiteral(":/VDRMainWindow/Resources/2 Drucken/01-drucken-seitenvorchau.ico")));
    m_scroll = new QScrollArea(this);
    m_image = new QLabel(m_scroll);
    m_scroll->setWidget(m_image);
    m_scroll->setWidgetResizable(false);
    m_label = new QLabel(this);
    m_label->setObjectName(QStringLiteral("labelPage"));
    auto* prev = new QPushButton(
        QIcon(QStringLiteral(":VDRMainWindow/Resources/icon-navigation-zurueck.png")), tr("previous"), this);
    prev->setObjectName(QStringLiteral("pbPrevious"));
    auto* next = new QPushButton(QIcon(QStringLiteral(":VDRMainWindow/Resources/icon-navigation-vor.png")),
                                 tr("next"), this);
    next->setObjectName(QStringLiteral("pbNext"));
    auto* ok = new QPushButton(QIcon(QStringLiteral(":/VDRMainWindow/Resources/icon-allgemein-ok.png")),
                               tr("OK"), this);
    connect(prev, &QPushButton::clicked, this, &CVdPrintPreview::previous);
    connect(next, &QPushButton::clicked, this, &CVdPrintPreview::next);
    connect(ok, &QPushButton::clicked, this, &QDialog::accept);
    auto* buttons = new QHBoxLayout;
    buttons->addWidget(prev);
    buttons->addWidget(m_label);
    buttons->addWidget(next);
    buttons->addStretch();
    buttons->addWidget(ok);
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(m_scroll);
    layout->addLayout(buttons);
    resize(800, 900);
}

CVdPrintPreview::~CVdPrintPreview()
{
    for (const QString& file : qAsConst(m_files))
        QFile::remove(file);
}

void CVdPrintPreview::showEvent(QShowEvent* event)
{
    QDialog::showEvent(event);
    display(0);
}

void CVdPrintPreview::display(int page)
{
    if (page < 0 || page >= m_files.size())
        return;
    m_page = page;
    const QImage image(m_files.at(page));
    const int width = qMax(1, m_scroll->viewport()->width() - 31);
    m_image->setPixmap(QPixmap::fromImage(image.scaledToWidth(width, Qt::SmoothTransformation)));
    m_image->adjustSize();
    m_label->setText(tr("Seite %1/%2").arg(page + 1).arg(m_files.size()));
}

void CVdPrintPreview::next()
{
    display(m_page + 1);
}

void CVdPrintPreview::previous()
{
    display(m_page - 1);
}
