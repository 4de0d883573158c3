# The libraries that Korvane's sources use; none of them shows in a public header.
find_package(ICU 72 REQUIRED COMPONENTS uc i18n)
