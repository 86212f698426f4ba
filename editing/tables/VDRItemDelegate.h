#pragma once

#include <QHash>
#include <QStyledItemDelegate>

class VDRSpellChecker;
class VDRSqlTableModel;

// Picks the editor of a cell after the editor number its model assigns to the column, formats the
// display, validates what is written back and keeps dependent columns up to date.
class VDRItemDelegate : public QStyledItemDelegate
{
    Q_OBJECT
public:
    typedef int EDITOR;

    VDRItemDelegate(int regIdx, QObject* parent = nullptr);

    // Lets the models build delegates of this kind (VDRSqlTableModel::createItemDelegate).
    static void installFactory();
    // The checker of the multi-line text editors; may be null.
    static void setSpellChecker(VDRSpellChecker* checker);
    // The register of the suggestion lists of a table's view.
    static int registerIndexFor(int tableName);

    void setEditorType(int column, EDITOR editor);
    void setEditorType(VDRSqlTableModel* model, const QString& column, EDITOR editor);
    EDITOR editorType(int column) const { return m_editors.value(column, 0); }
    int registerIndex() const { return m_regIdx; }
    Q_INVOKABLE void setEditorsEnabled(bool enabled) { m_enabled = enabled; }
    bool editorsEnabled() const { return m_enabled; }

    // Runs of blanks become one blank; an empty text becomes " " (text columns are NOT NULL).
    static QString check_text(const QString& text);
    // Minutes as "h:mm", negative values as "-h:mm"; empty for null.
    static QString formatMinutes(const QVariant& minutes);
    // The text a cell shows.
    QString cellText(const QModelIndex& index) const;

    QWidget* createEditor(QWidget* parent, const QStyleOptionViewItem& option,
                          const QModelIndex& index) const override;
    void setEditorData(QWidget* editor, const QModelIndex& index) const override;
    void setModelData(QWidget* editor, QAbstractItemModel* model, const QModelIndex& index) const override;
    void paint(QPainter* painter, const QStyleOptionViewItem& option,
               const QModelIndex& index) const override;
    QString displayText(const QVariant& value, const QLocale& locale) const override;
    QSize sizeHint(const QStyleOptionViewItem& option, const QModelIndex& index) const override;
    void updateEditorGeometry(QWidget* editor, const QStyleOptionViewItem& option,
                              const QModelIndex& index) const override;

signals:
    void hoursChangedByUser(const QModelIndex& index);
    void timeRecordingTimeChangedByUser(const QModelIndex& index, bool valid);

protected:
    bool eventFilter(QObject* object, QEvent* event) override;
    bool editorEvent(QEvent* event, QAbstractItemModel* model, const QStyleOptionViewItem& option,
                     const QModelIndex& index) override;
    void initStyleOption(QStyleOptionViewItem* option, const QModelIndex& index) const override;

private:
    // False (with the warning) when another deficiency of the report has this description.
    bool checkDfcyDescription(VDRSqlTableModel* model, const QModelIndex& index, const QString& text) const;
    void writeEquipmentTime(VDRSqlTableModel* model, const QModelIndex& index, const QTime& time) const;
    void writePhotoRelation(VDRSqlTableModel* model, const QModelIndex& index, int deficiencyId) const;

    int m_regIdx;
    bool m_enabled = true;
    QHash<int, EDITOR> m_editors;
};
