#pragma once

#include <cstddef>
#include <cstdint>

// What is done with one input, of the fuzz targets and of the tests that replay their findings. A broken
// promise ends the process with a message on standard error.

/// A records document or an archive of them, imported into an empty store without keeping anything.
void QVFuzzImport(const uint8_t* bytes, size_t size);

/// A unit string, and a value to convert from it.
void VSFuzzUnit(const uint8_t* bytes, size_t size);
