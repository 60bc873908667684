# The libraries of the platform. Each is linked by platform/linux or services only.

find_package(PkgConfig REQUIRED)
pkg_check_modules(SYSTEMD REQUIRED IMPORTED_TARGET libsystemd>=247)
pkg_check_modules(SECCOMP REQUIRED IMPORTED_TARGET libseccomp)
pkg_check_modules(P11KIT REQUIRED IMPORTED_TARGET p11-kit-1)
find_package(OpenSSL 3 REQUIRED COMPONENTS Crypto)
find_package(SQLite3 REQUIRED)
find_package(SQLiteCpp REQUIRED)
