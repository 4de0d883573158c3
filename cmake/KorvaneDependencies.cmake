# The libraries that Korvane's sources use; none of them shows in a public header.
korvane_find(ICU 72 COMPONENTS uc i18n PKGCONFIG icu-uc icu-i18n)
korvane_find(LibXml2 2.9.14 PKGCONFIG libxml-2.0)
