# The fuzz targets, shared by the libFuzzer build (fuzz/) and the corpus replay tests
# (tests/fuzz): each target's extra sources and libraries.
set(LUDMOX_FUZZ_TARGETS document formula protocol selection)
set(LUDMOX_FUZZ_document_LIBS LudMox::ReportRT)
set(LUDMOX_FUZZ_formula_LIBS LudMox::ReportRT)
set(LUDMOX_FUZZ_protocol_SOURCES
    ${PROJECT_SOURCE_DIR}/apps/ludmoxd/dialogcanceller.h
    ${PROJECT_SOURCE_DIR}/apps/ludmoxd/dialogcanceller.cpp)
set(LUDMOX_FUZZ_protocol_LIBS LudMox::Automation LudMox::ReportRT Qt6::Widgets)
set(LUDMOX_FUZZ_selection_LIBS LudMox::Selection)
