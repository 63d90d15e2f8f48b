#pragma once

#include "core/ludmoxexport.h"

#include <QProcessEnvironment>
#include <QString>
#include <QStringList>
#include <span>

namespace platform {

/// The settings of a site: what an administrator sets for every host on a machine, and a
/// user for their own programs. Each one is read, first found wins, from its environment
/// variable, the user's file "$XDG_CONFIG_HOME/ludmox/ludmox.conf", and the system's files
/// "ludmox/ludmox.conf" in the folders of $XDG_CONFIG_DIRS ("/etc/xdg" by default). The
/// files are INI files: "[Mail]" then "Url=smtps://mail.example.com". A value that is
/// empty counts as not set, so an empty variable does not hide a file's value.
class LUDMOX_EXPORT SiteSettings {
public:
    enum class Setting {
        ServerDriver,
        OdbcDriver,
        PdfPrinterFolder,
        PdfPrinters,
        SmtpUrl,
        SmtpUser,
        SmtpPassword,
        SmtpFrom,
        SmtpTimeout,
        Outbox,
        Trace,
        TuneAllocator,
    };

    /// Where a setting lives: its section and key in the files, and its variable.
    struct Entry {
        Setting setting;
        const char16_t* section;
        const char16_t* key;
        const char16_t* variable;
    };

    /// The process's environment and the user's and system's files.
    SiteSettings();
    /// The given environment and files (the first file is the user's, read first).
    SiteSettings(QProcessEnvironment environment, QStringList files);

    /// The value, trimmed of surrounding white space; empty when no source sets it.
    QString value(Setting setting) const;
    /// Whether a switch is on: "1", "true", "yes" or "on", in any case.
    bool isOn(Setting setting) const;

    /// Every setting, in the order the documentation lists them.
    static std::span<const Entry> entries();
    /// The user's file, then the system's, most important first.
    static QStringList defaultFiles();

private:
    QProcessEnvironment m_environment;
    QStringList m_files;
};

} // namespace platform
