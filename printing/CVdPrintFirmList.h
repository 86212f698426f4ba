#pragma once

#include "printing/CVdPrintout.h"

#include <QStringList>
#include <QVector>

// The two company lists of the diary: persons involved, and trades and companies.
class CVdPrintFirmList : public CVdPrintout
{
    Q_OBJECT
public:
    explicit CVdPrintFirmList(QObject* parent = nullptr);

    // To the printer, or to a PDF chosen in a dialog that proposes 'fileName' in the company-list folder.
    bool print(bool pdf, bool separateByPageBreak, QString fileName, const QString& defaultDir);
    // Any output; 'ask' shows the file dialog for a PDF.
    bool run(Output target, bool separateByPageBreak, const QString& fileName, bool ask,
             const QString& defaultDir = QString());

private:
    struct Block
    {
        bool heading = false;
        bool shaded = false;
        bool pageBreakBefore = false;
        QStringList lines; // a heading has one line; a company's first line is its name
        int height = 0;
        int page = 0;
        int y = 0;
    };
    void read_data(bool separateByPageBreak);
    void compute_block_metrics();
    int compute_block_height(const Block& block) const;
    void draw_block(QPainter& painter, const Block& block);

    QVector<Block> m_blocks;
    int m_line = 0;
    int m_headingLine = 0;
};
