#pragma once

/// Sets the process's LC_NUMERIC to "C" if it is not, and leaves it so: what the text streams do
/// when they are built. Their own numbers do not depend on it.
void kvFixLocale();
