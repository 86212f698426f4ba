#pragma once

#include "document/VDRSqlTableModel.h"
#include "editing/tables/VDRTableView.h"

#include <QVector>

class VDRDocument;

// What the report form shows: its table views with their columns, and its rich-text fields. Read when
// the form is built and each time it shows a report.
namespace VDREntryWidgetLayout {

struct Column
{
    const char* name;
    VDRTableView::COLUMNWIDTH_TYPE type;
    int width;
};

struct ViewLayout
{
    const char* objectName;
    VDRSqlTableModel::TABLE_NAMES table;
    const char* toolTip;
    QVector<Column> columns;
    bool (VDRDocument::*append)(int);
};

// In the order the models are submitted.
const QVector<ViewLayout>& viewLayouts();

// A rich-text field of the form: its widget, its column of `entry`, and the register whose
// suggestion texts it offers.
struct RichTextField
{
    const char* objectName;
    const char* column;
    const char* registerTitle;
    int registerIndex;
};
// Indexed by field number.
extern const RichTextField richTextFields[5];

// The view of the deficiencies, among viewLayouts().
constexpr int deficiencyView = 4;

// The deficiency list reads description, room, room book number, company, date, images.
void moveDeficiencySections(VDRTableView* v);

} // namespace VDREntryWidgetLayout
