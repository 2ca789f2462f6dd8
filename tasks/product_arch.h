#pragma once
// Where products are installed and for which architecture, as the installation's inventory tool says. Nothing is
// cached. Every failure gives an empty text or false and is traced; the caller makes its own failure of it. For any
// thread.

#include "util/string.h"

/// The architecture code of the product in the tool's platform listing; empty when it is not there.
VMQ::String getProductArch(const VMQ::String& productCode);

/// The directory of a product of that architecture, without a separator at its end; empty when an argument is.
VMQ::String getProductArchDir(const VMQ::String& arch, const VMQ::String& productCode);

/// The architecture code of the product's installed libraries. Of several, the first whose length and last two
/// characters are those of the hint, else the last; with an empty hint, the first. Platforms that have no "ax"
/// libraries are skipped for "ax". Hints and platforms of fewer than two characters never match each other.
VMQ::String getSharedLibArch(const VMQ::String& productCode, const VMQ::String& hint);

/// The directory of the shared libraries that fit product "ux" best, without a separator at its end; empty when
/// unknown.
VMQ::String getSharedLibArchDir();

/// True when the inventory lists the product.
bool isProductInStandardInventory(const VMQ::String& productCode);
