#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

#include "view/show/escape.hpp"
#include "view/show/text.hpp"
#include "view/show/warnings.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

std::string placeWords(const PathView& path) {
    return printable(path.initiator) + " -> " + printable(path.target) + " LUN " + path.lun;
}

void writeCountedHeading(std::ostream& output, const Style& style, std::string_view heading,
                         std::size_t count) {
    writeHeading(output, style, std::string(heading) + " (" + std::to_string(count) + ")");
}

void writeIdentityChanges(std::ostream& output, const Style& style, const Difference& difference) {
    const std::vector<IdentityChange>& changes = difference.identityChanges;
    const std::size_t dangerous = difference.dangerousChanges();
    if (dangerous > 0) {
        output << '\n'
               << style.problem << "DANGER: another LUN behind the same initiator, target and LUN number ("
               << dangerous << ')' << style.end << '\n';
    }
    for (const IdentityChange& change : changes) {
        if (change.isDangerous()) {
            output << "  " << placeWords(change.path) << "  " << printable(change.path.device) << "\n    was "
                   << printable(*change.before) << "\n    is  " << printable(*change.after) << '\n';
        }
    }
    if (dangerous < changes.size()) {
        writeCountedHeading(output, style, "Identifier readable in one log only", changes.size() - dangerous);
    }
    for (const IdentityChange& change : changes) {
        if (!change.isDangerous()) {
            output << "  " << placeWords(change.path) << "  " << printable(change.path.device)
                   << (change.before ? "  can no longer be read, was " : "  can be read now: ")
                   << printable(change.before ? *change.before : change.after.value_or("")) << '\n';
        }
    }
}

void writePaths(std::ostream& output, const Style& style, std::string_view heading,
                const std::vector<PathDifference>& paths, std::string_view unlistedWords) {
    if (paths.empty()) {
        return;
    }
    writeCountedHeading(output, style, heading, paths.size());
    Columns columns;
    for (const PathDifference& difference : paths) {
        columns.add({placeWords(difference.path), printable(difference.path.device),
                     printable(difference.identifier),
                     difference.isKnownUnlisted ? std::string(unlistedWords) : ""});
    }
    columns.write(output, "  ");
}

void writePathCounts(std::ostream& output, const Style& style, const std::vector<PathCountChange>& changes) {
    if (changes.empty()) {
        return;
    }
    writeCountedHeading(output, style, "LUNs with another number of paths", changes.size());
    Columns columns;
    for (const PathCountChange& change : changes) {
        std::string verdict = change.after < change.before ? "fewer" : "more";
        if (change.after == 0) {
            verdict = "gone";
        } else if (change.before == 0) {
            verdict = "new";
        }
        columns.add({verdict, std::to_string(change.before) + " -> " + std::to_string(change.after),
                     printable(change.identifier), printable(change.facts.vendor),
                     printable(change.facts.product)});
    }
    columns.write(output, "  ");
}

void writeDevices(std::ostream& output, const Style& style, std::string_view heading,
                  const std::vector<DeviceDifference>& devices) {
    if (devices.empty()) {
        return;
    }
    writeCountedHeading(output, style, heading, devices.size());
    Columns columns;
    for (const DeviceDifference& difference : devices) {
        columns.add({printable(difference.device), printable(difference.identifier)});
    }
    columns.write(output, "  ");
}

} // namespace

void writeText(std::ostream& output, const Difference& difference, const Style& style) {
    for (const std::string& warning : warningsOf(difference)) {
        output << "warning: " << warning << '\n';
    }
    if (difference.isEmpty()) {
        output << style.good << "No difference." << style.end << '\n';
        return;
    }
    writeIdentityChanges(output, style, difference);
    writePaths(output, style, "Lost paths", difference.lostPaths,
               "the new log identified such a device without listing it");
    writePaths(output, style, "New paths", difference.newPaths,
               "the old log identified such a device without listing it");
    writePathCounts(output, style, difference.pathCounts);
    writeDevices(output, style, "Lost direct disks", difference.lostDirect);
    writeDevices(output, style, "New direct disks", difference.newDirect);
    writeDevices(output, style, "Lost logical devices", difference.lostLogical);
    writeDevices(output, style, "New logical devices", difference.newLogical);
    if (difference.powerPathBefore && difference.powerPathAfter) {
        writeHeading(output, style,
                     "PowerPath was " + std::string(name(*difference.powerPathBefore)) + ", is " +
                         std::string(name(*difference.powerPathAfter)));
    }
}

} // namespace view
