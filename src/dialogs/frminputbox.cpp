#include "dialogs/frminputbox.h"

#include "core/comerror.h"
#include "core/text.h"
#include "dialogs/combocompletion.h"
#include "dialogs/dateentry.h"
#include "dialogs/dialogslogging_p.h"
#include "dialogs/fieldkind.h"
#include "dialogs/frmcalendar.h"
#include "dialogs/frmeditor.h"
#include "dialogs/numberentry.h"
#include "dialogs/uistrings.h"
#include "engine/moxglobals.h"
#include "platform/dialogservice.h"
#include "platform/olecolor.h"
#include "platform/twips.h"
#include "platform/windowhandles.h"

#include <QApplication>
#include <QCheckBox>
#include <QComboBox>
#include <QDateTime>
#include <QFontMetrics>
#include <QKeyEvent>
#include <QLabel>
#include <QLineEdit>
#include <QListWidget>
#include <QPainter>
#include <QProxyStyle>
#include <QPushButton>

namespace dialogs {

namespace {

const QString DesignedTitle = QStringLiteral(" LUD");
const QString CheckBoxBlankCaption = QString(9, u' ');
// The file-open picker's flags: the file must exist, no read-only check box.
constexpr int32_t FileOpenFlags = 0x1004;

/// Masks password fields with the character the visual style asks for.
class PasswordStyle : public QProxyStyle {
public:
    explicit PasswordStyle(QChar mask)
        : m_mask(mask)
    { }
    int styleHint(StyleHint hint, const QStyleOption* option, const QWidget* widget,
        QStyleHintReturn* returnData) const override
    {
        if (hint == SH_LineEdit_PasswordCharacter)
            return m_mask.unicode();
        return QProxyStyle::styleHint(hint, option, widget, returnData);
    }

private:
    QChar m_mask;
};

QString textOf(const core::Variant& value)
{
    try {
        return value.toText();
    } catch (const core::ComError&) {
        return {};
    }
}

bool booleanOf(const core::Variant& value)
{
    try {
        return value.toBoolean();
    } catch (const core::ComError&) {
        return false;
    }
}

struct Choice {
    QString text;
    bool selected = false;
};

/// The entries of a choice field: one per element of the first dimension; with two
/// dimensions element (i, 0) is the text and element (i, 1) pre-selects it.
std::vector<Choice> choicesOf(const core::Variant& value)
{
    std::vector<Choice> choices;
    const core::VariantArray& array = value.array();
    if (array.dimensions() == 1) {
        for (int32_t i = array.lbound(1); i <= array.ubound(1); ++i)
            choices.push_back({ textOf(array.at(i)) });
    } else if (array.dimensions() == 2) {
        const int32_t first = array.lbound(2);
        const bool hasSelection = array.ubound(2) > first;
        for (int32_t i = array.lbound(1); i <= array.ubound(1); ++i) {
            choices.push_back({ textOf(array.at({ i, first })),
                hasSelection && booleanOf(array.at({ i, first + 1 })) });
        }
    }
    return choices;
}

QString withoutLineBreaks(QString text)
{
    text.remove(u'\r');
    text.remove(u'\n');
    return text;
}

/// The character a key types, as Basic's KeyPress sees it: Backspace 8, Ctrl+letter
/// 1..26, printable characters their code; -1 for keys without a character.
int keyAscii(const QKeyEvent* event)
{
    if (event->key() == Qt::Key_Backspace)
        return KeyCode::Backspace;
    const Qt::KeyboardModifiers modifiers = event->modifiers();
    if ((modifiers & Qt::ControlModifier) && !(modifiers & Qt::AltModifier)
        && event->key() >= Qt::Key_A && event->key() <= Qt::Key_Z)
        return event->key() - Qt::Key_A + 1;
    const QString text = event->text();
    if (text.isEmpty() || text.at(0).unicode() == 127)
        return -1;
    const char16_t ch = text.at(0).unicode();
    return ch < 32 ? -1 : ch;
}

TextEdit editState(const QLineEdit* edit)
{
    if (edit->hasSelectedText()) {
        return { edit->text(), static_cast<int>(edit->selectionStart()),
            static_cast<int>(edit->selectedText().size()) };
    }
    return { edit->text(), static_cast<int>(edit->cursorPosition()), 0 };
}

void applyEdit(QLineEdit* edit, const TextEdit& state)
{
    if (edit->text() != state.text)
        edit->setText(state.text);
    if (state.selLength > 0)
        edit->setSelection(state.selStart, state.selLength);
    else
        edit->setCursorPosition(state.selStart);
}

QStyle::StandardPixmap standardIcon(MessageIcon icon)
{
    switch (icon) {
    case MessageIcon::Critical:
        return QStyle::SP_MessageBoxCritical;
    case MessageIcon::Exclamation:
        return QStyle::SP_MessageBoxWarning;
    case MessageIcon::Information:
        return QStyle::SP_MessageBoxInformation;
    default:
        return QStyle::SP_MessageBoxQuestion;
    }
}

} // namespace

/// One row of the dialog: its item and the controls made for it.
struct frmInputBox::Field {
    std::shared_ptr<InputBoxParamsItem> item;
    FieldKind kind = FieldKind::Text;
    QString tag;
    int index = 0;
    QLabel* label = nullptr;
    QWidget* control = nullptr;
    QLineEdit* edit = nullptr; // txData, txMData
    QComboBox* combo = nullptr; // cmbData, cmbSData
    QListWidget* list = nullptr; // lstData
    QCheckBox* check = nullptr; // chkData
    QWidget* browseBox = nullptr; // Picture2
    QPushButton* browse = nullptr; // cmdBrowse
    uint32_t backColor = WindowBackgroundColor; // text boxes, as an OLE colour
    // A drop-down list has no text selection of its own; completion keeps one here.
    int typedLength = 0;

    bool isDate() const { return tag.compare(QStringLiteral("Date"), Qt::CaseInsensitive) == 0; }
    bool isNumericEntry() const
    {
        return tag == QStringLiteral("Numeric") || (browse && tag == QStringLiteral("Color"));
    }
};

frmInputBox::frmInputBox(QWidget* parent)
    : QDialog(parent)
    , cmdOK(new QPushButton(QStringLiteral("&OK"), this))
    , cmdCancel(new QPushButton(QStringLiteral("&Cancel"), this))
{
    setObjectName(QStringLiteral("frmInputBox"));
    cmdOK->setObjectName(QStringLiteral("cmdOK"));
    cmdCancel->setObjectName(QStringLiteral("cmdCancel"));
    setWindowTitle(DesignedTitle);
    setFont(QFont(QStringLiteral("Tahoma"), 8));
    cmdOK->setAutoDefault(false);
    cmdCancel->setAutoDefault(false);

    const QColor back = platform::colorFromOle(engine::gBackColor);
    if (back.isValid()) {
        QPalette palette = this->palette();
        palette.setColor(QPalette::Window, back);
        setPalette(palette);
        setAutoFillBackground(true);
    }
    connect(cmdOK, &QPushButton::clicked, this, &frmInputBox::cmdOK_Click);
    connect(cmdCancel, &QPushButton::clicked, this, &frmInputBox::cmdCancel_Click);
    connect(qApp, &QApplication::focusChanged, this, &frmInputBox::onFocusChanged);
}

frmInputBox::~frmInputBox()
{
    // Hiding during destruction moves the focus; the fields are gone by then.
    disconnect(qApp, &QApplication::focusChanged, this, &frmInputBox::onFocusChanged);
}

void frmInputBox::setFieldLeaveHook(FieldLeaveHook hook)
{
    m_fieldLeaveHook = std::move(hook);
}

void frmInputBox::ShowBox(
    std::shared_ptr<InputBoxParams> Params, int32_t Buttons, const QString& Title)
{
    m_params = std::move(Params);
    m_buttons = Buttons;
    if (!m_params)
        m_params = std::make_shared<InputBoxParams>();

    const std::vector<InputBoxParams::ItemPtr> items = m_params->NewEnum();
    for (size_t i = 0; i < items.size(); ++i)
        createField(static_cast<int>(i) + 1, items[i]);
    for (auto& field : m_fields)
        fillField(*field);
    applyGeometry();
    if (!Title.isEmpty())
        setWindowTitle(Title);
    m_changed = false;
}

void frmInputBox::createField(int index, const std::shared_ptr<InputBoxParamsItem>& item)
{
    auto field = std::make_unique<Field>();
    Field& f = *field;
    f.item = item;
    f.index = index;
    f.kind = fieldKind(*item);
    f.tag = fieldTag(*item);
    item->Index = index;

    f.label = new QLabel(this);
    f.label->setObjectName(QStringLiteral("lblPrompt_%1").arg(index));
    const QString number = QString::number(index);
    switch (f.kind) {
    case FieldKind::MultiSelectList:
        f.list = new QListWidget(this);
        f.list->setObjectName(u"lstData_" + number);
        f.list->setSelectionMode(QAbstractItemView::MultiSelection);
        f.control = f.list;
        break;
    case FieldKind::DropDownList:
    case FieldKind::EditableCombo: {
        const bool editable = f.kind == FieldKind::EditableCombo;
        f.combo = new QComboBox(this);
        f.combo->setObjectName((editable ? u"cmbData_" : u"cmbSData_") + number);
        if (editable) {
            f.combo->setEditable(true);
            f.combo->setInsertPolicy(QComboBox::NoInsert);
            // Completion is the dialog's own, from the start of the entries.
            f.combo->setCompleter(nullptr);
            f.combo->lineEdit()->installEventFilter(this);
            m_fieldByWidget.insert(f.combo->lineEdit(), index - 1);
            connect(f.combo, &QComboBox::editTextChanged, this, [this] { m_changed = true; });
        }
        connect(f.combo, &QComboBox::currentIndexChanged, this, [this] { m_changed = true; });
        connect(f.combo, &QComboBox::activated, this, [this, &f] {
            m_changed = true;
            f.typedLength = 0;
        });
        f.control = f.combo;
        break;
    }
    case FieldKind::CheckBox:
        f.check = new QCheckBox(this);
        f.check->setObjectName(u"chkData_" + number);
        connect(f.check, &QCheckBox::toggled, this, [this] { m_changed = true; });
        f.control = f.check;
        break;
    case FieldKind::Text:
        f.edit = new QLineEdit(this);
        f.edit->setObjectName(u"txData_" + number);
        f.control = f.edit;
        break;
    default: {
        f.edit = new QLineEdit(this);
        f.edit->setObjectName(u"txMData_" + number);
        f.control = f.edit;
        f.browseBox = new QWidget(this);
        f.browseBox->setObjectName(u"Picture2_" + number);
        f.browse = new QPushButton(QStringLiteral("..."), f.browseBox);
        f.browse->setObjectName(u"cmdBrowse_" + number);
        f.browse->setAutoDefault(false);
        QFont arial(QStringLiteral("Arial"));
        if (!engine::gXPStyle)
            arial.setPointSize(10);
        f.browse->setFont(arial);
        m_fieldByWidget.insert(f.browse, index - 1);
        connect(f.browse, &QPushButton::clicked, this, [this, index] { cmdBrowse_Click(index); });
        if (f.kind == FieldKind::Color)
            f.edit->setFrame(false);
        break;
    }
    }
    if (f.edit) {
        connect(f.edit, &QLineEdit::textChanged, this, [this] { m_changed = true; });
        // Typing is handled key by key; this catches what reaches the text otherwise
        // (Delete, pasting) so that the separators still appear.
        connect(f.edit, &QLineEdit::textEdited, this, [&f] {
            if (f.isDate())
                applyEdit(f.edit, InsertDateSeparator(editState(f.edit), dateEntrySettings()));
        });
    }
    f.control->installEventFilter(this);
    m_fieldByWidget.insert(f.control, index - 1);
    m_fields.push_back(std::move(field));
}

void frmInputBox::fillField(Field& f)
{
    const InputBoxParamsItem& item = *f.item;
    // A value that cannot be shown leaves its control partly filled; the dialog still opens.
    try {
        f.label->setText(item.Label.isEmpty() ? item.Name : item.Label);
        if (!item.LabelToolTip.isEmpty())
            f.label->setToolTip(item.LabelToolTip);
        f.control->setEnabled(!item.ReadOnly);
        if (f.browse)
            f.browse->setEnabled(!item.ReadOnly);

        const QString defaultText = textOf(item.DefaultValue);
        // The entry equal to DefaultValue, else the first one.
        const auto initialEntry = [&defaultText](const std::vector<Choice>& choices) {
            for (size_t i = 0; i < choices.size(); ++i) {
                if (choices[i].text.compare(defaultText, Qt::CaseInsensitive) == 0)
                    return static_cast<int>(i);
            }
            return choices.empty() ? -1 : 0;
        };
        switch (f.kind) {
        case FieldKind::MultiSelectList: {
            const std::vector<Choice> choices = choicesOf(item.Value);
            for (size_t i = 0; i < choices.size(); ++i) {
                auto* entry = new QListWidgetItem(choices[i].text, f.list);
                entry->setData(Qt::UserRole, static_cast<int>(i));
                entry->setSelected(choices[i].selected);
            }
            if (const int current = initialEntry(choices); current >= 0) {
                f.list->selectionModel()->setCurrentIndex(
                    f.list->model()->index(current, 0), QItemSelectionModel::NoUpdate);
            }
            break;
        }
        case FieldKind::DropDownList:
        case FieldKind::EditableCombo: {
            const std::vector<Choice> choices = choicesOf(item.Value);
            for (size_t i = 0; i < choices.size(); ++i)
                f.combo->addItem(choices[i].text, static_cast<int>(i));
            f.combo->setCurrentIndex(initialEntry(choices));
            if (f.combo->lineEdit())
                f.combo->lineEdit()->deselect();
            break;
        }
        case FieldKind::CheckBox:
            f.check->setText(item.Caption.isEmpty() ? CheckBoxBlankCaption : item.Caption);
            f.check->setChecked(
                !(item.Value.isEmpty() || textOf(item.Value).isEmpty()) && booleanOf(item.Value));
            break;
        case FieldKind::Color:
            // A value that is no colour number leaves the window colour, and the text
            // shows whichever colour the swatch has.
            try {
                setBackColor(f, static_cast<uint32_t>(item.Value.toLong()));
            } catch (const core::ComError&) {
                setBackColor(f, WindowBackgroundColor);
            }
            f.edit->setText(QString::number(static_cast<int32_t>(f.backColor)));
            break;
        default:
            if (item.Password) {
                auto* style = new PasswordStyle(engine::gXPStyle ? QChar(0x25CF) : QChar(u'*'));
                // Owned by the dialog, so that it outlives the text box that uses it.
                style->setParent(this);
                f.edit->setStyle(style);
                f.edit->setEchoMode(QLineEdit::Password);
            }
            if (f.isDate()) {
                if (item.Value.isEmpty())
                    f.edit->clear();
                else if (item.Value.isDate())
                    f.edit->setText(formatDate(
                        item.Value.toDateTime().date(), dateEntrySettings().DatePattern));
                else
                    f.edit->setText(textOf(item.Value));
            } else if (f.tag == QStringLiteral("Numeric")) {
                f.edit->setText(item.Value.isNumeric() ? textOf(item.Value) : QString());
            } else {
                f.edit->setText(textOf(item.Value));
            }
            break;
        }
    } catch (const core::ComError& error) {
        qCWarning(lcDialogs) << "field" << item.Name << "not filled:" << error.description();
    }
}

void frmInputBox::applyGeometry()
{
    const qreal tppX = platform::twipsPerPixelX(this);
    const qreal tppY = platform::twipsPerPixelY(this);
    InputBoxLayoutOptions options;
    options.NoIco = m_params->NoIco;
    options.LabelAutoSize = m_params->LabelAutoSize;
    options.LabelLeftAlign = m_params->LabelLeftAlign;
    options.WideControls = m_params->WideControls;
    options.NoDefault = m_params->NoDefault;
    options.NoCancel = m_params->NoCancel;
    options.InputWidth = m_params->InputWidth;
    options.InputHeight = m_params->InputHeight;
    options.Buttons = m_buttons;
    options.xpStyle = engine::gXPStyle;
    options.twipsPerPixelX = tppX;
    options.twipsPerPixelY = tppY;

    std::vector<InputBoxLayoutField> rows;
    for (const auto& f : m_fields)
        rows.push_back({ f->kind, f->label->text() });
    const QFontMetrics metrics(font());
    m_geometry = layoutInputBox(rows, options, [&metrics, tppX](const QString& text) {
        return qRound((metrics.horizontalAdvance(text) + 2) * tppX);
    });
    const auto pixels
        = [tppX, tppY](const QRect& twips) { return twipsToPixels(twips, tppX, tppY); };

    for (size_t i = 0; i < m_fields.size(); ++i) {
        Field& f = *m_fields[i];
        const InputBoxFieldGeometry& g = m_geometry.fields[i];
        QRect label = pixels(g.label);
        label.setHeight(std::max(label.height(), metrics.height()));
        f.label->setGeometry(label);
        f.label->setAlignment(
            (m_geometry.labelsLeftAligned ? Qt::AlignLeft : Qt::AlignRight) | Qt::AlignVCenter);
        // A label cut at its widest keeps its whole text in the tool tip.
        if (metrics.horizontalAdvance(f.label->text()) > label.width()) {
            if (f.label->toolTip().isEmpty())
                f.label->setToolTip(f.label->text());
            f.label->setText(metrics.elidedText(f.label->text(), Qt::ElideRight, label.width()));
        }
        f.control->setGeometry(pixels(g.control));
        if (f.browseBox) {
            f.browseBox->setGeometry(pixels(g.browseBox));
            f.browse->setGeometry(pixels(g.browseButton));
        }
    }

    const QString okCaption = m_geometry.buttonSet == ButtonSet::Designed
        ? QStringLiteral("&OK")
        : GetUIString(UIString::OK);
    const QString cancelCaption = m_geometry.buttonSet == ButtonSet::Designed
        ? QStringLiteral("&Cancel")
        : GetUIString(UIString::Cancel);
    cmdOK->setText(okCaption);
    cmdCancel->setText(cancelCaption);
    cmdOK->setGeometry(pixels(m_geometry.ok));
    cmdCancel->setGeometry(pixels(m_geometry.cancel));
    cmdCancel->setVisible(m_geometry.cancelVisible);
    cmdOK->setDefault(m_geometry.okIsDefault);
    setFixedSize(qRound(m_geometry.width / tppX), qRound(m_geometry.height / tppY));
}

frmInputBox::Field* frmInputBox::fieldOf(const QObject* object) const
{
    const auto it = m_fieldByWidget.constFind(object);
    return it == m_fieldByWidget.constEnd() ? nullptr : m_fields[it.value()].get();
}

void frmInputBox::setBackColor(Field& f, uint32_t oleColor)
{
    f.backColor = oleColor;
    if (!f.edit)
        return;
    const QColor color = platform::colorFromOle(static_cast<int32_t>(oleColor));
    QPalette palette = f.edit->palette();
    palette.setColor(QPalette::Base,
        color.isValid() ? color : QApplication::palette(f.edit).color(QPalette::Base));
    f.edit->setPalette(palette);
}

bool frmInputBox::eventFilter(QObject* watched, QEvent* event)
{
    if (event->type() == QEvent::KeyPress) {
        if (Field* field = fieldOf(watched))
            return handleKey(*field, watched, static_cast<QKeyEvent*>(event));
    }
    return QDialog::eventFilter(watched, event);
}

bool frmInputBox::handleKey(Field& f, QObject* watched, QKeyEvent* event)
{
    if (watched == f.browse)
        return false;
    const int key = event->key();
    const Qt::KeyboardModifiers modifiers = event->modifiers() & ~Qt::KeypadModifier;
    if (key == Qt::Key_Escape) {
        if (m_geometry.cancelIsCancel)
            cmdCancel->click();
        return true;
    }
    if (key == Qt::Key_Return || key == Qt::Key_Enter) {
        handleEnter(f);
        return true;
    }
    if (key == Qt::Key_F2 && f.kind == FieldKind::Text) {
        const TextEdit state = editState(f.edit);
        if (state.isAllSelected())
            f.edit->setCursorPosition(static_cast<int>(f.edit->text().size()));
        else
            f.edit->selectAll();
        return true;
    }
    if (key == Qt::Key_F4 && modifiers == Qt::NoModifier && f.browse) {
        if (f.browse->isEnabled())
            cmdBrowse_Click(f.index);
        return true;
    }
    if (key == Qt::Key_Delete && f.kind == FieldKind::DropDownList)
        return autoComplete(f, KeyCode::Delete);

    const int ascii = keyAscii(event);
    if (ascii < 0)
        return false;
    if (f.combo)
        return autoComplete(f, ascii);
    if (!f.edit)
        return false;
    if (f.isDate()) {
        const KeyOutcome outcome = pressDateKey(editState(f.edit), ascii, dateEntrySettings());
        if (outcome.key != 0)
            return false;
        applyEdit(f.edit, outcome.edit);
        return true;
    }
    if (f.isNumericEntry()) {
        const int filtered = filterNumericKey(ascii, localeDecimalSeparator());
        if (filtered == 0) {
            QApplication::beep();
            return true;
        }
        if (filtered != ascii) {
            f.edit->insert(QString(QChar(static_cast<char16_t>(filtered))));
            return true;
        }
    }
    return false;
}

bool frmInputBox::autoComplete(Field& f, int key)
{
    const bool editable = f.kind == FieldKind::EditableCombo;
    ComboEdit state;
    if (editable) {
        state.edit = editState(f.combo->lineEdit());
    } else {
        const QString text = f.combo->currentText();
        const int typed = std::min(f.typedLength, static_cast<int>(text.size()));
        state.edit = { text, typed, static_cast<int>(text.size()) - typed };
    }
    state.listIndex = f.combo->currentIndex();
    QStringList entries;
    for (int i = 0; i < f.combo->count(); ++i)
        entries << f.combo->itemText(i);

    const ComboKeyOutcome outcome = AutoCompleteCombo(entries, state, key, editable);
    if (outcome.key != 0)
        return false;
    m_changed = true;
    const ComboEdit& result = outcome.combo;
    if (result.listIndex >= 0 && result.listIndex != f.combo->currentIndex())
        f.combo->setCurrentIndex(result.listIndex);
    if (editable) {
        QLineEdit* line = f.combo->lineEdit();
        if (result.listIndex < 0)
            f.combo->setCurrentIndex(-1);
        applyEdit(line, result.edit);
    } else {
        f.typedLength = result.edit.selStart;
    }
    return true;
}

void frmInputBox::handleEnter(Field& f)
{
    if (m_geometry.okIsDefault) {
        cmdOK->click();
        return;
    }
    if (f.edit && !leaveField(f, nullptr))
        return;
    focusNext(f);
}

void frmInputBox::focusNext(const Field& f)
{
    const int count = static_cast<int>(m_fields.size());
    for (int step = 1; step < count; ++step) {
        Field& next = *m_fields[(f.index - 1 + step) % count];
        if (next.control->isEnabled()) {
            next.control->setFocus(Qt::TabFocusReason);
            return;
        }
    }
}

bool frmInputBox::leaveField(Field& f, const QWidget* destination)
{
    if (!f.edit)
        return true;
    const QString text = f.edit->text();
    if (f.tag == QStringLiteral("Numeric") && !text.isEmpty()) {
        if (const auto normalized = normalizeNumber(text))
            f.edit->setText(*normalized);
    }
    if (f.isDate())
        checkDate(f);
    if (f.browse && f.tag == QStringLiteral("Color")) {
        try {
            const core::Variant number(f.edit->text());
            if (number.isNumeric() && !f.edit->text().isEmpty())
                setBackColor(f, static_cast<uint32_t>(number.toLong()));
        } catch (const core::ComError&) {
            // Not a colour number: the swatch keeps its colour.
        }
    }
    // Cancel must always be reachable, whatever the check thinks of the field.
    if (m_changed && destination != cmdCancel) {
        const bool allowed = !m_fieldLeaveHook || m_fieldLeaveHook(f.index);
        m_changed = !allowed;
        return allowed;
    }
    return true;
}

void frmInputBox::checkDate(Field& f)
{
    const DateFieldState checked
        = CheckDateField({ f.edit->text(), f.backColor }, dateEntrySettings());
    if (checked.text != f.edit->text())
        f.edit->setText(checked.text);
    if (checked.backColor != f.backColor)
        setBackColor(f, checked.backColor);
}

void frmInputBox::onFocusChanged(QWidget* old, QWidget* now)
{
    if (m_refocusing || !isVisible())
        return;
    if (!engine::gXPStyle) {
        if (Field* f = fieldOf(now); f && now == f->browse)
            f->browse->setText(QStringLiteral(".."));
        if (Field* f = fieldOf(old); f && old == f->browse && !m_browseDialogOpen)
            f->browse->setText(QStringLiteral("..."));
    }

    Field* leaving = fieldOf(old);
    Field* entering = fieldOf(now);
    // Focus that goes to another window (a picker, the calendar) has not left the field.
    const bool staysInDialog = now && now->window() == this;
    if (leaving && leaving->edit && old == leaving->edit && staysInDialog) {
        if (!leaveField(*leaving, now)) {
            m_refocusing = true;
            leaving->edit->setFocus(Qt::OtherFocusReason);
            m_refocusing = false;
            return;
        }
    }
    if (entering && entering != leaving) {
        if (entering->edit && now == entering->edit)
            entering->edit->selectAll();
        else if (entering->combo && entering->combo->lineEdit())
            entering->combo->lineEdit()->selectAll();
        else if (entering->combo)
            entering->typedLength = 0;
    }
}

void frmInputBox::showEvent(QShowEvent* event)
{
    QDialog::showEvent(event);
    if (m_activated)
        return;
    m_activated = true;
    if (!m_fields.empty())
        m_fields.front()->control->setFocus(Qt::ActiveWindowFocusReason);
}

void frmInputBox::keyPressEvent(QKeyEvent* event)
{
    if (event->key() == Qt::Key_Escape) {
        if (m_geometry.cancelIsCancel)
            cmdCancel->click();
        return;
    }
    if ((event->key() == Qt::Key_Return || event->key() == Qt::Key_Enter)
        && !m_geometry.okIsDefault) {
        return;
    }
    QDialog::keyPressEvent(event);
}

void frmInputBox::paintEvent(QPaintEvent* event)
{
    QDialog::paintEvent(event);
    if (!m_geometry.iconVisible)
        return;
    const qreal tppX = platform::twipsPerPixelX(this);
    const qreal tppY = platform::twipsPerPixelY(this);
    const QPoint at(
        qRound(m_geometry.iconPosition.x() / tppX), qRound(m_geometry.iconPosition.y() / tppY));
    QPainter painter(this);
    style()
        ->standardIcon(standardIcon(m_geometry.icon), nullptr, this)
        .paint(&painter, QRect(at, QSize(32, 32)));
}

void frmInputBox::cmdBrowse_Click(int index)
{
    if (index < 1 || index > static_cast<int>(m_fields.size()))
        return;
    Field& f = *m_fields[index - 1];
    if (!f.edit)
        return;
    const QString text = f.edit->text();
    const int32_t owner = platform::WindowHandles::handle(this);
    // A picker that fails leaves the field as it was; the text box gets the focus back.
    try {
        switch (f.kind) {
        case FieldKind::Color:
            if (const auto color = platform::DialogService::active()->chooseColor(
                    owner, static_cast<int32_t>(f.backColor))) {
                setBackColor(f, static_cast<uint32_t>(*color));
                f.edit->setText(QString::number(*color));
            }
            break;
        case FieldKind::FilePath: {
            platform::DialogService::FileRequest request;
            request.ownerWindow = owner;
            // Both separators split, so a path written for another system still opens
            // the picker in its folder.
            const qsizetype split = std::max(text.lastIndexOf(u'/'), text.lastIndexOf(u'\\'));
            if (split >= 0) {
                request.initialDirectory = text.left(split + 1);
                request.fileName = text.mid(split + 1);
            } else {
                request.fileName = text;
            }
            request.flags = FileOpenFlags;
            if (const auto path = platform::DialogService::active()->openFile(request))
                f.edit->setText(*path);
            break;
        }
        case FieldKind::FolderPath:
            if (const auto folder
                = platform::DialogService::active()->chooseFolder(owner, QString(), text))
                f.edit->setText(*folder);
            break;
        default:
            if (f.isDate()) {
                frmCalendar calendar(this);
                const auto date = parseDateText(text, dateEntrySettings().DatePattern);
                calendar.Value(date ? *date : frmCalendar::zeroDate());
                m_browseDialogOpen = true;
                calendar.exec();
                m_browseDialogOpen = false;
                if (!calendar.Canceled()) {
                    f.edit->setText(core::text::format(
                        QDateTime(calendar.Value(), QTime(12, 0)), core::text::shortDatePattern()));
                }
            } else {
                frmEditor editor(this);
                editor.Text(text);
                editor.setWindowTitle(QStringLiteral("LUD"));
                m_browseDialogOpen = true;
                editor.exec();
                m_browseDialogOpen = false;
                if (!editor.Canceled())
                    f.edit->setText(editor.Text());
            }
            break;
        }
    } catch (const core::ComError& error) {
        m_browseDialogOpen = false;
        qCWarning(lcDialogs) << "browse of field" << index << "failed:" << error.description();
    }
    if (!engine::gXPStyle)
        f.browse->setText(QStringLiteral("..."));
    f.edit->setFocus(Qt::OtherFocusReason);
}

void frmInputBox::cmdOK_Click()
{
    // Enter on the default button leaves the field without a focus change; it is checked
    // here as if it had been left, so a typed number or colour is normalised first.
    if (Field* focused = fieldOf(QApplication::focusWidget());
        focused && focused->edit && QApplication::focusWidget() == focused->edit) {
        if (!leaveField(*focused, cmdOK))
            return;
    }
    for (const auto& field : m_fields) {
        Field& f = *field;
        const bool required = f.item->MustExist;
        switch (f.kind) {
        case FieldKind::MultiSelectList:
            if (required && f.list->selectedItems().isEmpty()) {
                f.list->setFocus(Qt::OtherFocusReason);
                return;
            }
            break;
        case FieldKind::DropDownList:
        case FieldKind::EditableCombo:
            if (required && f.combo->currentText().isEmpty()) {
                f.combo->setFocus(Qt::OtherFocusReason);
                return;
            }
            break;
        case FieldKind::CheckBox:
            break;
        default:
            if (f.isDate()) {
                checkDate(f);
                if (f.backColor == dateEntrySettings().FieldHighlightColor) {
                    f.edit->setFocus(Qt::OtherFocusReason);
                    return;
                }
            }
            if (required && f.edit->text().isEmpty()) {
                f.edit->setFocus(Qt::OtherFocusReason);
                return;
            }
            break;
        }
    }
    StoreValues();
    Result = true;
    accept();
}

void frmInputBox::cmdCancel_Click()
{
    Result = false;
    reject();
}

void frmInputBox::StoreValues()
{
    for (const auto& field : m_fields) {
        Field& f = *field;
        InputBoxParamsItem& item = *f.item;
        switch (f.kind) {
        case FieldKind::MultiSelectList: {
            QStringList selected;
            for (int i = 0; i < f.list->count(); ++i) {
                if (f.list->item(i)->isSelected())
                    selected << f.list->item(i)->text();
            }
            item.SelectionCount = static_cast<int32_t>(selected.size());
            if (selected.isEmpty())
                selected << QString();
            core::VariantArray texts(
                { { 0, static_cast<int32_t>(selected.size()) - 1 } }, core::VariantType::String);
            for (qsizetype i = 0; i < selected.size(); ++i)
                texts.at(static_cast<int32_t>(i)) = core::Variant(selected.at(i));
            item.Value = core::Variant(texts);
            break;
        }
        case FieldKind::DropDownList:
        case FieldKind::EditableCombo:
            item.Value = core::Variant(withoutLineBreaks(f.combo->currentText()));
            break;
        case FieldKind::Color:
            item.Value = core::Variant(QString::number(static_cast<int32_t>(f.backColor)));
            break;
        case FieldKind::CheckBox:
            item.Value
                = core::Variant(f.check->isChecked() ? QStringLiteral("1") : QStringLiteral("0"));
            break;
        case FieldKind::Memo:
            item.Value = core::Variant(f.edit->text());
            break;
        default:
            item.Value = core::Variant(withoutLineBreaks(f.edit->text()));
            break;
        }
    }
}

} // namespace dialogs
