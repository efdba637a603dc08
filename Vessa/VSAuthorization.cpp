#include "Vessa/VSAuthorization.h"

#include <algorithm>
#include <iterator>

bool vs_requiresAuthorization(const VSSource& source) {
    return source.bundleIdentifier != VSSource::application().bundleIdentifier && !source.isImported();
}

std::vector<VSSource> vs_sourcesForAuthorization(const std::vector<VSSource>& sources) {
    std::vector<VSSource> selected;
    std::copy_if(sources.begin(), sources.end(), std::back_inserter(selected), vs_requiresAuthorization);
    return selected;
}

std::vector<VSSource> vs_sourcesForDevices(const std::vector<VSSource>& sources) {
    std::vector<VSSource> selected;
    std::copy_if(sources.begin(), sources.end(), std::back_inserter(selected),
                 [](const VSSource& source) { return !vs_requiresAuthorization(source); });
    return selected;
}
