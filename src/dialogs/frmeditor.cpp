#include "dialogs/frmeditor.h"

#include "core/comerror.h"
#include "dialogs/dialogslogging_p.h"
#include "dialogs/editorlayout.h"
#include "dialogs/ludsettings.h"
#include "dialogs/uistrings.h"
#include "engine/moxglobals.h"
#include "platform/olecolor.h"
#include "platform/twips.h"

#include <QFontDatabase>
#include <QGuiApplication>
#include <QKeyEvent>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QScreen>

namespace dialogs {

namespace {

constexpr int FontPoints = 9;
// The designed client area, in twips.
constexpr QSize DesignedSize(4596, 3000);

int twipsPer(qreal factor)
{
    return qRound(factor);
}

bool isCtrlF4(const QKeyEvent* event)
{
    return event->key() == Qt::Key_F4
        && (event->modifiers() & ~Qt::KeypadModifier) == Qt::ControlModifier;
}

} // namespace

frmEditor::frmEditor(QWidget* parent)
    : QDialog(parent)
    , txtMemo(new QPlainTextEdit(this))
    , cmdOK(new QPushButton(this))
    , cmdCancel(new QPushButton(this))
    , TwipsPerPixelX(twipsPer(platform::twipsPerPixelX(this)))
    , TwipsPerPixelY(twipsPer(platform::twipsPerPixelY(this)))
{
    setObjectName(QStringLiteral("frmEditor"));
    txtMemo->setObjectName(QStringLiteral("txtMemo"));
    cmdOK->setObjectName(QStringLiteral("cmdOK"));
    cmdCancel->setObjectName(QStringLiteral("cmdCancel"));
    setWindowTitle(QStringLiteral("Editor"));
    setFont(QFont(QStringLiteral("Tahoma"), 8));
    setSizeGripEnabled(true);
    txtMemo->setTabChangesFocus(true);
    txtMemo->installEventFilter(this);
    applyFont();

    const QColor back = platform::colorFromOle(engine::gBackColor);
    if (back.isValid()) {
        QPalette palette = this->palette();
        palette.setColor(QPalette::Window, back);
        setPalette(palette);
        setAutoFillBackground(true);
    }
    setMinimumSize(
        EditorMinimumSize.width() / TwipsPerPixelX, EditorMinimumSize.height() / TwipsPerPixelY);
    cmdOK->setText(GetUIString(UIString::OK));
    cmdCancel->setText(GetUIString(UIString::Cancel));
    cmdOK->setDefault(false);
    cmdOK->setAutoDefault(false);
    cmdCancel->setAutoDefault(false);
    connect(cmdOK, &QPushButton::clicked, this, [this] {
        m_canceled = false;
        accept();
    });
    connect(cmdCancel, &QPushButton::clicked, this, &frmEditor::cancel);
    restoreWindow();
}

frmEditor::~frmEditor() = default;

QString frmEditor::Text() const
{
    return txtMemo->toPlainText();
}

void frmEditor::Text(const QString& text)
{
    txtMemo->setPlainText(text);
}

void frmEditor::Locked(bool locked)
{
    m_locked = locked;
    txtMemo->setReadOnly(locked);
    cmdOK->setEnabled(!locked);
}

void frmEditor::FixedFont(bool fixed)
{
    m_fixedFont = fixed;
    applyFont();
}

void frmEditor::applyFont()
{
    QFont font = m_fixedFont ? QFontDatabase::systemFont(QFontDatabase::FixedFont)
                             : QFont(QStringLiteral("Tahoma"));
    font.setPointSize(FontPoints);
    txtMemo->setFont(font);
}

void frmEditor::cancel()
{
    m_canceled = true;
    reject();
}

void frmEditor::restoreWindow()
{
    const QScreen* screen = QGuiApplication::primaryScreen();
    const QSize screenSize = screen ? screen->geometry().size() : QSize(1024, 768);
    // Without stored settings the window opens centred over its owner or the screen.
    const QSize designed(
        DesignedSize.width() / TwipsPerPixelX, DesignedSize.height() / TwipsPerPixelY);
    const QRect area = parentWidget() ? parentWidget()->window()->frameGeometry()
                                      : QRect(QPoint(0, 0), screenSize);
    const QPoint centred = area.center() - QPoint(designed.width() / 2, designed.height() / 2);
    QRect stored(centred.x() * TwipsPerPixelX, centred.y() * TwipsPerPixelY, DesignedSize.width(),
        DesignedSize.height());
    // Unreadable or unstorable settings leave the window where and as big as it is.
    try {
        const LUDSettings settings;
        const auto read = [&settings](const QString& key, int fallback) {
            try {
                return settings.Value(key, core::Variant(fallback)).toLong();
            } catch (const core::ComError&) {
                return fallback;
            }
        };
        stored = QRect(read(QStringLiteral("MELeft"), stored.left()),
            read(QStringLiteral("METop"), stored.top()),
            read(QStringLiteral("MEWidth"), stored.width()),
            read(QStringLiteral("MEHeight"), stored.height()));
    } catch (const core::ComError& error) {
        qCWarning(lcDialogs) << "memo editor settings not read:" << error.description();
    }
    const QRect placed = placeEditorWindow(
        stored, QSize(screenSize.width() * TwipsPerPixelX, screenSize.height() * TwipsPerPixelY));
    move(placed.left() / TwipsPerPixelX, placed.top() / TwipsPerPixelY);
    resize(placed.width() / TwipsPerPixelX, placed.height() / TwipsPerPixelY);
}

void frmEditor::saveWindow()
{
    try {
        LUDSettings settings;
        settings.Value(QStringLiteral("MELeft"), {}, core::Variant(pos().x() * TwipsPerPixelX));
        settings.Value(QStringLiteral("METop"), {}, core::Variant(pos().y() * TwipsPerPixelY));
        settings.Value(QStringLiteral("MEWidth"), {}, core::Variant(width() * TwipsPerPixelX));
        settings.Value(QStringLiteral("MEHeight"), {}, core::Variant(height() * TwipsPerPixelY));
    } catch (const core::ComError& error) {
        qCWarning(lcDialogs) << "memo editor settings not stored:" << error.description();
    }
}

void frmEditor::done(int result)
{
    if (isVisible())
        saveWindow();
    QDialog::done(result);
}

void frmEditor::keyPressEvent(QKeyEvent* event)
{
    if (isCtrlF4(event)) {
        cancel();
        return;
    }
    QDialog::keyPressEvent(event);
}

bool frmEditor::eventFilter(QObject* watched, QEvent* event)
{
    if (watched == txtMemo && event->type() == QEvent::KeyPress) {
        const auto* key = static_cast<QKeyEvent*>(event);
        if (key->key() == Qt::Key_Escape || isCtrlF4(key)) {
            cancel();
            return true;
        }
    }
    return QDialog::eventFilter(watched, event);
}

void frmEditor::resizeEvent(QResizeEvent* event)
{
    QDialog::resizeEvent(event);
    const EditorGeometry g = editorGeometry(
        QSize(width() * TwipsPerPixelX, height() * TwipsPerPixelY), TwipsPerPixelY);
    const auto pixels = [this](const QRect& twips) {
        return QRect(twips.x() / TwipsPerPixelX, twips.y() / TwipsPerPixelY,
            twips.width() / TwipsPerPixelX, twips.height() / TwipsPerPixelY);
    };
    txtMemo->setGeometry(pixels(g.memo));
    cmdOK->setGeometry(pixels(g.ok));
    cmdCancel->setGeometry(pixels(g.cancel));
}

} // namespace dialogs
