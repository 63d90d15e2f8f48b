#pragma once

#include <QDialog>
#include <QString>
#include <cstdint>

class QPlainTextEdit;
class QPushButton;

namespace dialogs {

/// The memo editor: a resizable modal window with one multi-line text box and OK / Cancel,
/// opened by the parameter dialog to edit long texts. The caller sets Text (and Locked,
/// FixedFont, CharSet), shows it modally and reads Canceled and Text afterwards.
///
/// The window's position and size are kept per user ("MELeft", "METop", "MEWidth",
/// "MEHeight", in twips). Closing it in any way only hides it, so the results stay
/// readable.
class frmEditor : public QDialog {
    Q_OBJECT

public:
    explicit frmEditor(QWidget* parent = nullptr);
    ~frmEditor() override;

    QString Text() const;
    void Text(const QString& text);
    bool Locked() const { return m_locked; }
    /// Read-only text; OK stays disabled so that only Cancel closes the window.
    void Locked(bool locked);
    bool FixedFont() const { return m_fixedFont; }
    /// A fixed-pitch font instead of Tahoma, 9 points either way.
    void FixedFont(bool fixed);
    /// The character set hosts give the text box's font. Fonts here are Unicode, so it is
    /// kept for them to read back but changes nothing.
    int16_t CharSet() const { return m_charSet; }
    void CharSet(int16_t charSet) { m_charSet = charSet; }
    /// True until OK is pressed.
    bool Canceled() const { return m_canceled; }

    void done(int result) override;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override;
    void keyPressEvent(QKeyEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

private:
    void cancel();
    void restoreWindow();
    void saveWindow();
    void applyFont();

    QPlainTextEdit* txtMemo;
    QPushButton* cmdOK;
    QPushButton* cmdCancel;
    int TwipsPerPixelX;
    int TwipsPerPixelY;
    bool m_locked = false;
    bool m_fixedFont = false;
    int16_t m_charSet = 0;
    bool m_canceled = true;
};

} // namespace dialogs
