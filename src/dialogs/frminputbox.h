#pragma once

#include "dialogs/inputboxlayout.h"
#include "dialogs/inputboxparams.h"

#include <QDialog>
#include <QHash>
#include <QString>
#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

class QPushButton;

namespace dialogs {

/// The parameter input dialog, built at run time from an InputBoxParams list: one row per
/// field (label and control of the field's kind), an optional message-box icon, OK and
/// Cancel.
///
/// The caller builds it with ShowBox, shows it modally (exec) and reads Result and the
/// items. OK writes every field's value back into its item once all required fields are
/// filled and all date fields hold dates; Cancel and closing the window write nothing.
class frmInputBox : public QDialog {
    Q_OBJECT

public:
    /// Decides whether a text field that was edited may be left; receives the field's
    /// Index. Leaving is refused when it returns false.
    using FieldLeaveHook = std::function<bool(int index)>;

    explicit frmInputBox(QWidget* parent = nullptr);
    ~frmInputBox() override;

    /// Creates, fills and places the controls for the fields of `Params` (does not show
    /// the dialog). `Buttons` follows the message-box convention: its low four bits choose
    /// OK only (0) or OK and Cancel (1), its bits 16..64 the icon. A non-empty `Title`
    /// becomes the window title. Every item's Index is set to its 1-based position.
    void ShowBox(std::shared_ptr<InputBoxParams> Params, int32_t Buttons, const QString& Title);

    /// True after OK, false after Cancel or closing.
    bool Result = false;
    /// The help context of the dialog (the list's HelpId).
    int32_t HelpContextID = 0;

    /// Replaces the check consulted when an edited text field is left (by default every
    /// field may be left).
    void setFieldLeaveHook(FieldLeaveHook hook);

    /// Where ShowBox placed everything, in twips.
    const InputBoxGeometry& placement() const { return m_geometry; }

protected:
    bool eventFilter(QObject* watched, QEvent* event) override;
    void keyPressEvent(QKeyEvent* event) override;
    void paintEvent(QPaintEvent* event) override;
    void showEvent(QShowEvent* event) override;

private:
    struct Field;

    void createField(int index, const std::shared_ptr<InputBoxParamsItem>& item);
    void fillField(Field& field);
    void applyGeometry();
    Field* fieldOf(const QObject* object) const;

    bool handleKey(Field& field, QObject* watched, QKeyEvent* event);
    bool autoComplete(Field& field, int key);
    void handleEnter(Field& field);
    void focusNext(const Field& field);
    bool leaveField(Field& field, const QWidget* destination);
    void checkDate(Field& field);
    void setBackColor(Field& field, uint32_t oleColor);
    void onFocusChanged(QWidget* old, QWidget* now);

    void cmdBrowse_Click(int index);
    void cmdOK_Click();
    void cmdCancel_Click();
    void StoreValues();

    std::shared_ptr<InputBoxParams> m_params;
    int32_t m_buttons = 0;
    std::vector<std::unique_ptr<Field>> m_fields;
    QHash<const QObject*, int> m_fieldByWidget; // control, combo editor, browse button
    InputBoxGeometry m_geometry;
    QPushButton* cmdOK;
    QPushButton* cmdCancel;
    FieldLeaveHook m_fieldLeaveHook;
    bool m_browseDialogOpen = false;
    bool m_changed = false;
    bool m_activated = false;
    bool m_refocusing = false;
};

} // namespace dialogs
