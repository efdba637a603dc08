#pragma once

#include "Vessa/VSHealthStore.h"
#include "Vessa/VSStoreReader.h"

/// Checks the whole store in one snapshot: the file's pages, the numbers' order, references, summaries, and
/// every rollup against one made anew. Throws VSDatabaseFailure where it cannot go on.
VSCheckReport VSCheckStore(VSStoreReader& reader);
