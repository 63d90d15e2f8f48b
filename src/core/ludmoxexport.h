#pragma once

/// Marks a class or function as part of the installed libraries' interface. Everything
/// else is built with hidden visibility, so hosts can only bind to what carries this mark
/// and the libraries are free to change their internals between releases.
#define LUDMOX_EXPORT __attribute__((visibility("default")))
