#include "editing/printdialogs/VDRPrintPreviewWidget.h"

#include "editing/printdialogs/VDRPrintPreviewA4PageWidget.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QPicture>
#include <QPushButton>
#include <QVBoxLayout>

VDRPrintPreviewWidget::VDRPrintPreviewWidget(QWidget* parent)
    : QWidget(parent), m_sheet(new VDRPrintPreviewA4PageWidget(this)), m_label(new QLabel(this)),
      m_previous(new QPushButton(
          QIcon(QStringLiteral(":VDRMainWindow/Resources/icon-navigation-zurueck.png")), QString(), this)),
      m_next(new QPushButton(QIcon(QStringLiteral(":VDRMainWindow/Resources/icon-navigation-vor.png")),
                             QString(), this))
{
    m_sheet->setObjectName(QStringLiteral("page"));
    m_label->setObjectName(QStringLiteral("labelPage"));
    m_previous->setObjectName(QStringLiteral("pbPrevious"));
    m_next->setObjectName(QStringLiteral("pbNext"));
    m_previous->setToolTip(tr("Vorherige Seite"));
    m_next->setToolTip(tr("Nächste Seite"));
    connect(m_previous, &QPushButton::clicked, this, &VDRPrintPreviewWidget::previousPage);
    connect(m_next, &QPushButton::clicked, this, &VDRPrintPreviewWidget::nextPage);
    auto* bar = new QHBoxLayout;
    bar->addWidget(m_previous);
    bar->addStretch();
    bar->addWidget(m_label);
    bar->addStretch();
    bar->addWidget(m_next);
    auto* layout = new QVBoxLayout(this);
    layout->addLayout(bar);
    layout->addWidget(m_sheet, 1);
    updateButtons();
}

void VDRPrintPreviewWidget::setPreviewFiles(const QList<QString>& files)
{
    m_files = files;
    m_page = -1;
    m_sheet->setPicture(QPicture());
    m_label->clear();
    displayPage(0);
    updateButtons();
}

void VDRPrintPreviewWidget::displayPage(int page)
{
    if (page < 0 || page >= m_files.size())
        return;
    m_page = page;
    QPicture picture;
    // A file that cannot be read shows as an empty sheet.
    if (!picture.load(m_files.at(page)))
        picture = QPicture();
    m_sheet->setPicture(picture);
    m_label->setText(tr("<b>Seite %1/%2</b>").arg(page + 1).arg(m_files.size()));
    updateButtons();
}

void VDRPrintPreviewWidget::updateButtons()
{
    m_previous->setEnabled(m_page > 0);
    m_next->setEnabled(m_page >= 0 && m_page + 1 < m_files.size());
}
