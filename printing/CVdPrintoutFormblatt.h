#pragma once

#include "printing/CVdPrintout.h"

// The blank report form: one page of captions with room for handwriting.
class CVdPrintoutFormblatt : public CVdPrintout
{
    Q_OBJECT
public:
    explicit CVdPrintoutFormblatt(QObject* parent = nullptr);

    // To the printer, or to a PDF chosen in a dialog.
    bool print(bool pdf);
    bool run(Output target, const QString& fileName, bool ask);

    // The captions' print-text ids, top to bottom.
    static const QVector<int>& captionIds();

private:
    int compute_info_dy() const;
    int compute_block_dy(int infoDy) const;
};
