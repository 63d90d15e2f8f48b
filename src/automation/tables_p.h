#pragma once

// The dispatch tables of the component, one function per class, each in its own
// <class>dispatch.cpp. A new class adds its function here and to registerComponentTables.

namespace automation {

class Registry;

void registerEnumerations(Registry& registry);

// The component's classes, in the type library's order.
void registerMoxEngine115(Registry& registry);
void registerMoxReports115(Registry& registry);
void registerMoxStatus115(Registry& registry);
void registerMoxEvents115(Registry& registry);
void registerMoxReport115(Registry& registry);
void registerClsMoxViewer115(Registry& registry);
void registerIMoxViewer115(Registry& registry);

// Platform and runtime classes: described for late binding, not in the type library.
void registerDictionary(Registry& registry);
void registerCollection(Registry& registry);
void registerEnumerator(Registry& registry);
void registerRuntimeReport(Registry& registry);

// The component's own classes that hosts reach by member name only.
void registerInputBoxParams(Registry& registry);
void registerInputBoxParamsItem(Registry& registry);

/// Adds every table above to the registry, the type library's classes in library order.
void registerComponentTables(Registry& registry);

} // namespace automation
