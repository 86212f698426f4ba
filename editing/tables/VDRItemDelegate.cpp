#include "editing/tables/VDRItemDelegate.h"

#include "document/VDRDocument.h"
#include "document/VDRDocumentsDb.h"
#include "document/VDRPrompt.h"
#include "document/VDRSqlTableModel.h"
#include "editing/completion/VDRCompleter.h"
#include "editing/completion/VDRCompleterFactory.h"
#include "editing/completion/VDRCompleterLineEdit.h"
#include "editing/completion/VDRCompleterTextEdit.h"
#include "editing/form/VDRRegisterNames.h"
#include "editing/tables/CVdCompanyComboBox.h"
#include "editing/tables/VDRFileLineEdit.h"
#include "editing/tables/VDRIntModel.h"
#include "editing/tables/VDRTableView.h"
#include "editing/tables/VDRTextEditComboBox.h"
#include "editing/time/VDRDateEdit.h"
#include "editing/time/VDRTimeEdit.h"

#include <QAbstractItemView>
#include <QDoubleValidator>
#include <QFileInfo>
#include <QKeyEvent>
#include <QLineEdit>
#include <QPointer>
#include <QRegularExpressionValidator>
#include <QSpinBox>
#include <QSqlField>
#include <QSqlRecord>
#include <QTimer>

#include <cfloat>
#include <climits>

namespace {
VDRSpellChecker* g_spellChecker = nullptr;

// Painting and measuring a cell look at no more than this much of its text.
const int kMaxDisplayLength = 2000;

bool isCompanyEditor(int editor)
{
    return editor == 1 || editor == 2 || editor == 3 || editor == 17 || editor == 53 || editor == 55;
}

bool isLineEditor(int editor)
{
    return editor == 5 || (editor >= 8 && editor <= 11) || (editor >= 26 && editor <= 30) || editor == 33 ||
           editor == 34 || editor == 45 || editor == 46;
}

bool isTextEditor(int editor)
{
    return editor == 6 || editor == 7 || editor == 12 || (editor >= 18 && editor <= 25) || editor == 36 ||
           editor == 37 || editor == 54;
}

bool isTimeEditor(int editor)
{
    return editor == 14 || editor == 40 || editor == 44 || editor == 47 || editor == 48;
}

// A box opened while an editor commits would take its focus and close it under the committing
// code; the message comes once the edit has ended.
void showLater(const QString& title, const QString& text)
{
    QTimer::singleShot(0, [title, text] { VDRPrompt::warning(title, text); });
}

// Text columns that must not be NULL refuse an empty date or time instead.
bool isRequired(const VDRSqlTableModel* model, int column)
{
    return model && model->record().field(column).requiredStatus() == QSqlField::Required;
}

bool isDecimalEditor(int editor)
{
    return editor == 39 || editor == 41 || editor == 43;
}

VDRSqlTableModel* sqlModel(const QAbstractItemModel* model)
{
    return qobject_cast<VDRSqlTableModel*>(const_cast<QAbstractItemModel*>(model));
}

QString fieldName(const VDRSqlTableModel* model, int column)
{
    return model ? model->record().fieldName(column) : QString();
}
} // namespace

VDRItemDelegate::VDRItemDelegate(int regIdx, QObject* parent) : QStyledItemDelegate(parent), m_regIdx(regIdx)
{
}

void VDRItemDelegate::installFactory()
{
    VDRSqlTableModel::setDelegateFactory(
        [](VDRSqlTableModel* model, QObject* view, int column, bool enabled) -> QObject* {
            auto* delegate = new VDRItemDelegate(registerIndexFor(model->tableNameId()), view);
            for (int c = 0; c < model->columnCount(); ++c) {
                if (column < 0 || c == column)
                    delegate->setEditorType(c, model->editorNumber(c));
            }
            delegate->setEditorsEnabled(enabled);
            QObject::connect(delegate, &VDRItemDelegate::hoursChangedByUser, model,
                             &VDRSqlTableModel::hoursChangedByUser);
            QObject::connect(delegate, &VDRItemDelegate::timeRecordingTimeChangedByUser, model,
                             &VDRSqlTableModel::timeRecordingTimeChangedByUser);
            return delegate;
        });
}

void VDRItemDelegate::setSpellChecker(VDRSpellChecker* checker)
{
    g_spellChecker = checker;
}

int VDRItemDelegate::registerIndexFor(int tableName)
{
    using M = VDRSqlTableModel;
    switch (tableName) {
    case M::TN_ATTENDEE:
    case M::TN_WORKFORCE:
    case M::TN_TIME_RECORDING:
        return VDRRegisterNames::Anwesende;
    case M::TN_DELAY:
    case M::TN_OBSTRUCTION:
    case M::TN_DEFICIENCY:
    case M::TN_PHOTO_DEFICIENCY:
    case M::TN_PHOTO_OBSTRUCTION:
        return VDRRegisterNames::Stoerungen;
    case M::TN_CONSTRUCTION_MEASURE:
    case M::TN_DIRECTIVE:
    case M::TN_PHOTO_MEASURE:
        return VDRRegisterNames::Bauablauf;
    case M::TN_AUXILIARY_SERVICE:
    case M::TN_TELEPHONE_NOTICE:
    case M::TN_CONCERN:
        return VDRRegisterNames::Vermerke;
    case M::TN_CONSTRUCTION_MATERIAL:
    case M::TN_PHOTO_MATERIAL:
        return VDRRegisterNames::Baustoffe;
    case M::TN_SCHEDULED_DELIVERY:
        return VDRRegisterNames::PlaeneUndDokumente;
    case M::TN_EQUIPMENT:
        return VDRRegisterNames::GeraeteUndMaschinen;
    default:
        return VDRRegisterNames::Bautenstand;
    }
}

void VDRItemDelegate::setEditorType(int column, EDITOR editor)
{
    if (column >= 0)
        m_editors.insert(column, editor);
}

void VDRItemDelegate::setEditorType(VDRSqlTableModel* model, const QString& column, EDITOR editor)
{
    if (model)
        setEditorType(model->fieldIndex(column), editor);
}

QString VDRItemDelegate::check_text(const QString& text)
{
    QString result;
    result.reserve(text.size());
    for (const QChar c : text) {
        if (c == QLatin1Char(' ') && result.endsWith(QLatin1Char(' ')))
            continue;
        result.append(c);
    }
    return result.isEmpty() ? QStringLiteral(" ") : result;
}

QString VDRItemDelegate::formatMinutes(const QVariant& minutes)
{
    if (minutes.isNull() || !minutes.isValid())
        return QString();
    const qint64 value = minutes.toLongLong();
    const qint64 magnitude = value < 0 ? -value : value;
    const QString text =
        QStringLiteral("%1:%2").arg(magnitude / 60).arg(magnitude % 60, 2, 10, QLatin1Char('0'));
    return value < 0 ? QLatin1Char('-') + text : text;
}

QWidget* VDRItemDelegate::createEditor(QWidget* parent, const QStyleOptionViewItem& option,
                                       const QModelIndex& index) const
{
    Q_UNUSED(option)
    if (!m_enabled || !index.isValid())
        return nullptr;
    VDRSqlTableModel* model = sqlModel(index.model());
    VDRDocument* document = model ? model->getDocument() : nullptr;
    const int editor = editorType(index.column());
    const QString title = model ? model->objectName() : QString();
    const int tableID = model ? int(model->tableNameId()) : 0;
    const QString column = index.model()->headerData(index.column(), Qt::Horizontal).toString();

    if (isCompanyEditor(editor)) {
        auto* combo = new CVdCompanyComboBox(parent);
        combo->set_company_data(document, editor);
        connect(combo, &CVdCompanyComboBox::companyChosen, this, [this, combo](int) {
            auto* self = const_cast<VDRItemDelegate*>(this);
            emit self->commitData(combo);
            emit self->closeEditor(combo);
        });
        return combo;
    }
    if (isLineEditor(editor)) {
        auto* edit =
            VDRCompleterFactory::createEditorLine(parent, m_regIdx, title, tableID, column, index.column());
        edit->setFrame(false);
        return edit;
    }
    if (isTextEditor(editor)) {
        auto* edit = VDRCompleterFactory::createSpellCheckEditorText(parent, m_regIdx, title, tableID, column,
                                                                     index.column(), g_spellChecker);
        edit->setFrameShape(QFrame::NoFrame);
        edit->setTabChangesFocus(true);
        if (editor == 54)
            edit->setProperty("tableName",
                              model ? VDRSqlTableModel::sqlTableName(model->tableNameId()) : QString());
        return edit;
    }
    if (editor == 13 || editor == 35) {
        auto* edit = new VDRDateEdit(parent);
        edit->setFrame(false);
        return edit;
    }
    if (isTimeEditor(editor)) {
        auto* edit = new VDRTimeEdit(parent);
        edit->setFrame(false);
        return edit;
    }
    if (editor == 15 || editor == 42) {
        auto* spin = new QSpinBox(parent);
        // Temperatures on a site go below zero.
        const bool signedValue = fieldName(model, index.column()) == QLatin1String("material_temperature");
        spin->setRange(signedValue ? INT_MIN : 0, INT_MAX);
        if (editor == 42) {
            spin->setSingleStep(5);
            spin->setSuffix(tr(" min"));
            spin->setAlignment(Qt::AlignRight | Qt::AlignVCenter);
            spin->setFrame(false);
        }
        return spin;
    }
    if (editor == 31 || editor == 32) {
        auto* edit = new VDRFileLineEdit(editor == 31 ? 0 : 1, parent);
        edit->setFrame(false);
        edit->setCompleterData(document, tableID, fieldName(model, index.column()), index.column());
        return edit;
    }
    if (editor == 38) {
        auto* edit = new QLineEdit(parent);
        edit->setReadOnly(true);
        edit->setFrame(false);
        return edit;
    }
    if (isDecimalEditor(editor)) {
        auto* edit = new QLineEdit(parent);
        auto* validator = new QDoubleValidator(0, DBL_MAX, 2, edit);
        validator->setNotation(QDoubleValidator::StandardNotation);
        edit->setValidator(validator);
        edit->setAlignment(Qt::AlignRight | Qt::AlignVCenter);
        edit->setReadOnly(editor == 41);
        edit->setFrame(false);
        return edit;
    }
    if (editor == 49 || editor == 50) {
        auto* edit = new QLineEdit(parent);
        edit->setValidator(new QRegularExpressionValidator(
            QRegularExpression(QStringLiteral("(?:[0-9]+:[0-5][0-9])?")), edit));
        edit->setAlignment(Qt::AlignCenter);
        edit->setFrame(false);
        return edit;
    }
    if (editor == 52) {
        auto* combo = new VDRTextEditComboBox(qobject_cast<VDRTableView*>(this->parent()), parent, false);
        combo->setDocument(document);
        connect(combo, &VDRTextEditComboBox::picked, this, [this, combo](int) {
            auto* self = const_cast<VDRItemDelegate*>(this);
            emit self->commitData(combo);
            emit self->closeEditor(combo);
        });
        if (document && model) {
            VDRSqlTableModel* deficiencies = document->modelEntryDfcy(model->entryId());
            if (deficiencies) {
                deficiencies->fetch_all();
                for (int row = 0; row < deficiencies->rowCount(); ++row)
                    combo->addItem(deficiencies->data(row, QStringLiteral("description"), Qt::EditRole)
                                       .toString()
                                       .trimmed(),
                                   deficiencies->data(row, QStringLiteral("id"), Qt::EditRole).toInt());
            }
        }
        return combo;
    }
    return nullptr;
}

void VDRItemDelegate::setEditorData(QWidget* editor, const QModelIndex& index) const
{
    const QVariant value = index.data(Qt::EditRole);
    const int kind = editorType(index.column());
    if (auto* combo = qobject_cast<CVdCompanyComboBox*>(editor)) {
        combo->setCurrentCompanyId(value.isNull() ? 0 : value.toInt());
    } else if (auto* date = qobject_cast<VDRDateEdit*>(editor)) {
        date->setDate(value.toDate());
    } else if (auto* time = qobject_cast<VDRTimeEdit*>(editor)) {
        time->setTime(value.toTime());
    } else if (auto* text = qobject_cast<VDRCompleterTextEdit*>(editor)) {
        text->setPlainText(value.toString().trimmed().isEmpty() ? QString() : value.toString());
    } else if (auto* spin = qobject_cast<QSpinBox*>(editor)) {
        spin->setValue(value.toInt());
    } else if (auto* picker = qobject_cast<VDRTextEditComboBox*>(editor)) {
        picker->setCurrentId(value.isNull() ? -1 : value.toInt());
    } else if (auto* line = qobject_cast<QLineEdit*>(editor)) {
        if (isDecimalEditor(kind))
            line->setText(value.isNull() ? QString() : line->locale().toString(value.toDouble(), 'f', 2));
        else if (kind == 49 || kind == 50)
            line->setText(formatMinutes(value));
        else
            line->setText(value.toString().trimmed().isEmpty() ? QString() : value.toString());
    } else {
        QStyledItemDelegate::setEditorData(editor, index);
    }
}

void VDRItemDelegate::setModelData(QWidget* editor, QAbstractItemModel* abstractModel,
                                   const QModelIndex& index) const
{
    VDRSqlTableModel* model = sqlModel(abstractModel);
    const int kind = editorType(index.column());
    const QVariant old = index.data(Qt::EditRole);
    const QString field = fieldName(model, index.column());

    if (auto* combo = qobject_cast<CVdCompanyComboBox*>(editor)) {
        const int id = combo->currentCompanyId();
        if (id > 0)
            abstractModel->setData(index, id);
        else if (id == 0 && !old.isNull())
            abstractModel->setData(index, QVariant(QVariant::Int));
        if (id > 0 && model && model->tableNameId() == VDRSqlTableModel::TN_DEFICIENCY) {
            // Photos assigned to a deficiency name its company.
            if (VDRDocument* document = model->getDocument()) {
                const int deficiencyId = model->data(index.row(), QStringLiteral("id"), Qt::EditRole).toInt();
                if (VDRSqlTableModel* photos = document->modelEntryPhoto2(model->entryId()))
                    photos->updateCompany4PhotoModel(deficiencyId, id);
            }
        }
        return;
    }
    if (auto* date = qobject_cast<VDRDateEdit*>(editor)) {
        abstractModel->setData(index,
                               date->text().trimmed().isEmpty() && old.isNull() ? QVariant() : date->date());
        return;
    }
    if (auto* time = qobject_cast<VDRTimeEdit*>(editor)) {
        if (kind == 47 || kind == 48) {
            writeEquipmentTime(model, index, time->time2());
            return;
        }
        const QTime value = time->time();
        if (!value.isValid() && isRequired(model, index.column()))
            return;
        abstractModel->setData(index, value.isValid() ? QVariant(value) : QVariant(QVariant::Time));
        if (kind == 44)
            emit const_cast<VDRItemDelegate*>(this)->timeRecordingTimeChangedByUser(index, value.isValid());
        return;
    }
    if (auto* text = qobject_cast<VDRCompleterTextEdit*>(editor)) {
        const QString value = check_text(text->toPlainText());
        if (kind == 54 && !checkDfcyDescription(model, index, value))
            return;
        if (value != old.toString())
            abstractModel->setData(index, value);
        text->learnText();
        return;
    }
    if (auto* spin = qobject_cast<QSpinBox*>(editor)) {
        spin->interpretText();
        abstractModel->setData(index, spin->value());
        if (kind == 42)
            emit const_cast<VDRItemDelegate*>(this)->timeRecordingTimeChangedByUser(index, true);
        return;
    }
    if (auto* picker = qobject_cast<VDRTextEditComboBox*>(editor)) {
        writePhotoRelation(model, index, picker->currentId());
        return;
    }
    if (auto* file = qobject_cast<VDRFileLineEdit*>(editor)) {
        const QString text = file->text().trimmed();
        QString name = text;
        const QFileInfo info(text);
        if (file->mode() == 0 && model && info.isAbsolute() && info.isFile()) {
            // A chosen file is stored in the documents database, once the edit has ended (storing
            // may have to tell the user something); the cell keeps its name.
            const QPersistentModelIndex cell(index);
            QPointer<VDRSqlTableModel> target(model);
            QTimer::singleShot(0, model, [target, cell, text] {
                if (!target || !cell.isValid())
                    return;
                const QString stored = VDRDocumentsDb::addDocument(
                    target->getDocument(), VDRSqlTableModel::sqlTableName(target->tableNameId()),
                    target->data(cell.row(), QStringLiteral("id"), Qt::EditRole).toInt(), target->entryId(),
                    text);
                if (!stored.isEmpty())
                    target->setData(cell, stored);
            });
            return;
        }
        abstractModel->setData(index, name.isEmpty() ? QVariant(QVariant::String) : QVariant(name));
        return;
    }
    auto* line = qobject_cast<QLineEdit*>(editor);
    if (!line || line->isReadOnly())
        return;
    if (isDecimalEditor(kind)) {
        const QString text = line->text().trimmed();
        bool ok = false;
        const double value = line->locale().toDouble(text, &ok);
        if (text.isEmpty())
            abstractModel->setData(index, QVariant(QVariant::Double));
        else if (ok)
            abstractModel->setData(index, value);
        else
            return;
        if (kind == 43)
            emit const_cast<VDRItemDelegate*>(this)->hoursChangedByUser(index);
        return;
    }
    if (kind == 49 || kind == 50) {
        const QString text = line->text().trimmed();
        if (text.isEmpty()) {
            if (!old.isNull())
                abstractModel->setData(index, QVariant(QVariant::Int));
            return;
        }
        const QStringList parts = text.split(QLatin1Char(':'));
        bool hoursOk = false;
        bool minutesOk = false;
        const qint64 hours = parts.size() == 2 ? parts.at(0).toLongLong(&hoursOk) : 0;
        const qint64 minutes = parts.size() == 2 ? parts.at(1).toLongLong(&minutesOk) : 0;
        const qint64 value = hours * 60 + minutes;
        if (!hoursOk || !minutesOk || hours < 0 || minutes < 0 || minutes > 59 || value > INT_MAX) {
            showLater(tr("Warnung"), tr("Sie haben eine ungültigen Wert eingegeben."));
            return;
        }
        if (old.isNull() || old.toLongLong() != value)
            abstractModel->setData(index, int(value));
        return;
    }
    if (field == QLatin1String("document")) {
        const QString text = line->text().trimmed();
        abstractModel->setData(index, text.isEmpty() ? QVariant(QVariant::String) : QVariant(text));
        return;
    }
    const QString value = check_text(line->text());
    if (value != old.toString())
        abstractModel->setData(index, value);
}

bool VDRItemDelegate::checkDfcyDescription(VDRSqlTableModel* model, const QModelIndex& index,
                                           const QString& text) const
{
    if (!model)
        return true;
    const int column = model->fieldIndex(QStringLiteral("description"));
    for (int row = 0; row < model->rowCount(); ++row) {
        if (row == index.row())
            continue;
        if (model->data(model->index(row, column), Qt::EditRole).toString().trimmed() == text.trimmed() &&
            !text.trimmed().isEmpty()) {
            VDRPrompt::warning(tr("Mängeltabelle"),
                               tr("Es existiert bereits ein Mangel mit dieser Beschreibung.\n"
                                  "Bitte ändern Sie die Beschreibung."));
            return false;
        }
    }
    return true;
}

void VDRItemDelegate::writeEquipmentTime(VDRSqlTableModel* model, const QModelIndex& index,
                                         const QTime& time) const
{
    if (!model)
        return;
    const int row = index.row();
    const bool exit = editorType(index.column()) == 48;
    model->setData(index, time.isValid() ? QVariant(time) : QVariant(QVariant::Time));
    if (exit && !time.isValid()) {
        model->setData(row, QStringLiteral("entry_time"), QVariant(QVariant::Time));
        model->setData(row, QStringLiteral("operating_time"), QVariant(QVariant::Int));
        return;
    }
    const QTime entryTime = model->data(row, QStringLiteral("entry_time"), Qt::EditRole).toTime();
    const QTime exitTime = model->data(row, QStringLiteral("exit_time"), Qt::EditRole).toTime();
    if (!entryTime.isValid() || !exitTime.isValid())
        return;
    int seconds = entryTime.secsTo(exitTime);
    if (seconds < 0)
        seconds += 86400;
    model->setData(row, QStringLiteral("operating_time"), seconds / 60);
}

void VDRItemDelegate::writePhotoRelation(VDRSqlTableModel* model, const QModelIndex& index,
                                         int deficiencyId) const
{
    if (!model)
        return;
    const QVariant old = index.data(Qt::EditRole);
    const int oldId = old.isNull() ? -1 : old.toInt();
    const int newId = deficiencyId > 0 ? deficiencyId : -1;
    if (oldId == newId)
        return;
    model->setData(index, newId);
    VDRDocument* document = model->getDocument();
    VDRSqlTableModel* deficiencies = document ? document->modelEntryDfcy(model->entryId()) : nullptr;
    if (!deficiencies)
        return;
    const int relationColumn = model->fieldIndex(QStringLiteral("relation_id"));
    const auto countPhotos = [&](int id) {
        int count = 0;
        for (int row = 0; row < model->rowCount(); ++row)
            count += model->data(model->index(row, relationColumn), Qt::EditRole).toInt() == id ? 1 : 0;
        return count;
    };
    for (int id : {oldId, newId}) {
        if (id > 0)
            deficiencies->setDataById(id, QStringLiteral("image_cnt"), countPhotos(id));
    }
    if (newId > 0)
        model->setData(index.row(), QStringLiteral("company_id"),
                       deficiencies->dataById(newId, QStringLiteral("company_id"), Qt::EditRole));
}

QString VDRItemDelegate::cellText(const QModelIndex& index) const
{
    const int kind = editorType(index.column());
    VDRSqlTableModel* model = sqlModel(index.model());
    const QVariant value = index.data(Qt::EditRole);
    if (isCompanyEditor(kind) ||
        (model && model->displayroleType(index.column()) == VDRSqlTableModel::DRT_COMPANY))
        return CVdCompanyComboBox::companyText(model ? model->getDocument() : nullptr,
                                               value.isNull() ? 0 : value.toInt(), kind);
    if (kind == 49 || kind == 50)
        return formatMinutes(value);
    if (kind == 51)
        return value.isNull() || value.toInt() == 0 ? QString() : QString::number(value.toInt());
    if (kind == 43 || (kind == 38 && fieldName(model, index.column()) == QLatin1String("man_hours")))
        return value.isNull() ? QString() : QLocale().toString(value.toDouble(), 'f', 2);
    if (kind == 52) {
        VDRDocument* document = model ? model->getDocument() : nullptr;
        VDRSqlTableModel* deficiencies = document ? document->modelEntryDfcy(model->entryId()) : nullptr;
        return deficiencies && value.toInt() > 0
                   ? deficiencies->dataById(value.toInt(), QStringLiteral("description"), Qt::EditRole)
                         .toString()
                   : QString();
    }
    return index.data(Qt::DisplayRole).toString();
}

void VDRItemDelegate::initStyleOption(QStyleOptionViewItem* option, const QModelIndex& index) const
{
    QStyledItemDelegate::initStyleOption(option, index);
    if (!(option->features & QStyleOptionViewItem::HasDisplay) &&
        !isCompanyEditor(editorType(index.column())))
        return;
    QString text = cellText(index);
    if (text.size() > kMaxDisplayLength)
        text = text.left(kMaxDisplayLength) + QChar(0x2026);
    option->text = text;
    option->features |= QStyleOptionViewItem::HasDisplay;
    const int kind = editorType(index.column());
    if (isDecimalEditor(kind) || kind == 42)
        option->displayAlignment = Qt::AlignRight | Qt::AlignVCenter;
    else if (kind == 49 || kind == 50)
        option->displayAlignment = Qt::AlignCenter;
}

void VDRItemDelegate::paint(QPainter* painter, const QStyleOptionViewItem& option,
                            const QModelIndex& index) const
{
    QStyledItemDelegate::paint(painter, option, index);
}

QString VDRItemDelegate::displayText(const QVariant& value, const QLocale& locale) const
{
    const QString text = QStyledItemDelegate::displayText(value, locale);
    return text.size() > kMaxDisplayLength ? text.left(kMaxDisplayLength) + QChar(0x2026) : text;
}

QSize VDRItemDelegate::sizeHint(const QStyleOptionViewItem& option, const QModelIndex& index) const
{
    return QStyledItemDelegate::sizeHint(option, index);
}

void VDRItemDelegate::updateEditorGeometry(QWidget* editor, const QStyleOptionViewItem& option,
                                           const QModelIndex& index) const
{
    QRect rect = option.rect;
    // Multi-line texts get room for a few lines even in a low row.
    if (isTextEditor(editorType(index.column())) || editorType(index.column()) == 52)
        rect.setHeight(std::max(rect.height(), 4 * option.fontMetrics.height()));
    editor->setGeometry(rect);
}

bool VDRItemDelegate::eventFilter(QObject* object, QEvent* event)
{
    // An editor that waits for a dialog of its own stays open meanwhile.
    if (event->type() == QEvent::FocusOut && object->property("editorBusy").toBool())
        return false;
    // Return in a multi-line text ends the edit; Shift+Return makes a new line.
    if (event->type() == QEvent::KeyPress) {
        auto* key = static_cast<QKeyEvent*>(event);
        auto* edit = qobject_cast<VDRCompleterTextEdit*>(object);
        if (edit && (key->key() == Qt::Key_Return || key->key() == Qt::Key_Enter) &&
            !(key->modifiers() & Qt::ShiftModifier)) {
            if (!edit->completer() || !edit->completer()->popup()->isVisible()) {
                emit commitData(edit);
                emit closeEditor(edit, QAbstractItemDelegate::SubmitModelCache);
                return true;
            }
        }
    }
    return QStyledItemDelegate::eventFilter(object, event);
}

bool VDRItemDelegate::editorEvent(QEvent* event, QAbstractItemModel* model,
                                  const QStyleOptionViewItem& option, const QModelIndex& index)
{
    // Check boxes are toggled here, not in an editor: locked reports keep them as they are.
    if (!m_enabled)
        return false;
    return QStyledItemDelegate::editorEvent(event, model, option, index);
}
