# The libraries of the platform. Each is linked by platform/linux or services only.

find_package(PkgConfig REQUIRED)
pkg_check_modules(SYSTEMD REQUIRED IMPORTED_TARGET libsystemd>=247)
pkg_check_modules(SECCOMP REQUIRED IMPORTED_TARGET libseccomp)
pkg_check_modules(PAM REQUIRED IMPORTED_TARGET pam)
pkg_check_modules(P11KIT REQUIRED IMPORTED_TARGET p11-kit-1)
find_package(OpenSSL 3 REQUIRED COMPONENTS Crypto)
find_package(SQLite3 REQUIRED)
find_package(SQLiteCpp REQUIRED)
find_package(Qt6 6.4 REQUIRED COMPONENTS Test UiTools Widgets)

# Without its -pthread, which says nothing new here, and with which no precompiled header is used.
pkg_check_modules(PCSC REQUIRED libpcsclite)
add_library(vlm::pcsc INTERFACE IMPORTED)
target_include_directories(vlm::pcsc INTERFACE ${PCSC_INCLUDE_DIRS})
target_link_libraries(vlm::pcsc INTERFACE ${PCSC_LINK_LIBRARIES})

# The archive where there is one, so that no program loads a further library for it.
pkg_check_modules(PUGIXML REQUIRED IMPORTED_TARGET pugixml>=1.10)
find_library(VLM_PUGIXML_ARCHIVE NAMES libpugixml.a HINTS ${PUGIXML_LIBRARY_DIRS})
add_library(vlm::pugixml INTERFACE IMPORTED)
if(VLM_PUGIXML_ARCHIVE)
    target_include_directories(vlm::pugixml INTERFACE ${PUGIXML_INCLUDE_DIRS})
    target_link_libraries(vlm::pugixml INTERFACE "${VLM_PUGIXML_ARCHIVE}")
else()
    target_link_libraries(vlm::pugixml INTERFACE PkgConfig::PUGIXML)
endif()
