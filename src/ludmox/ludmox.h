#pragma once

// Everything a host needs: the engine, its report collection and reports, their status and
// events, the parameter dialog's model, the preview window, the runtime's registration and
// the automation server.

#include "automation/server.h"
#include "core/collection.h"
#include "core/comerror.h"
#include "core/dictionary.h"
#include "core/variant.h"
#include "dialogs/inputboxparams.h"
#include "dialogs/inputboxparamsitem.h"
#include "engine/moxengine115.h"
#include "ludmox/version.h"
#include "reportrt/viewer/registerruntime.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115.h"
#include "reports/moxreports115.h"
#include "reports/moxstatus115.h"
#include "viewer/clsmoxviewer115.h"
#include "viewer/imoxviewer115.h"
#include "viewer/ludmoxviewerformsdi.h"
#include "viewer/moxviewer115.h"
