#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"
#include "dialogs/inputboxparamsitem.h"

#include <QString>
#include <cstdint>
#include <memory>
#include <vector>

namespace dialogs {

/// The field list the parameter input dialog is built from: one InputBoxParamsItem per
/// field, in the order the fields appear, plus options for the whole dialog.
///
/// Keys are compared without regard to case and occur at most once. Every option starts
/// at its zero value (False, 0, Empty).
class LUDMOX_EXPORT InputBoxParams : public core::Object {
public:
    using ItemPtr = std::shared_ptr<InputBoxParamsItem>;

    QString className() const override { return QStringLiteral("InputBoxParams"); }

    /// No message-box icon; the icon column takes no width.
    bool NoIco = false;
    /// The dialog's width follows the widest label.
    bool LabelAutoSize = false;
    /// Height of list fields in twips; used only when numeric.
    core::Variant InputHeight;
    /// Extra width in twips for every input control; used only when numeric.
    core::Variant InputWidth;
    bool LabelLeftAlign = false;
    int32_t HelpId = 0;
    /// Carried into the dialog; nothing depends on it.
    bool ValidateOnOK = false;
    /// OK is not the default button: Enter moves to the next field instead.
    bool NoDefault = false;
    /// Cancel does not react to Escape.
    bool NoCancel = false;
    /// With NoIco: the controls take over the width of the icon column.
    bool WideControls = false;

    /// The item stored under `key`; a missing key creates an item named `key`, appends it
    /// and returns it, so asking for a field by name is how a field is added.
    ItemPtr Item(const QString& key);
    int32_t Count() const { return static_cast<int32_t>(m_items.size()); }
    /// The items in insertion order (the host's for-each).
    std::vector<ItemPtr> NewEnum() const;
    /// True when an item with that key exists; never creates one.
    bool Exists(const QString& key) const;
    /// Removes the item with that key; a missing key is ignored.
    void Remove(const QString& key);

private:
    // The key stays what it was when the item was created, even if a host renames the
    // item afterwards, as in a keyed collection.
    struct Entry {
        QString key;
        ItemPtr item;
    };
    std::vector<Entry>::const_iterator find(const QString& key) const;

    std::vector<Entry> m_items;
};

} // namespace dialogs
