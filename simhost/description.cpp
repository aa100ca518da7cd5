#include "simhost/description.hpp"

#include "simhost/description_parts.hpp"
#include "simhost/toml_reader.hpp"

namespace simhost {
namespace {

Host hostOf(const toml::table& document) {
    Keys keys(document, "host");
    Host host;
    host.about = keys.string("about").value_or("");
    host.hostName = keys.string("hostname").value_or("simhost");
    host.sysBlock = sysBlockOf(keys);
    host.files = filesOf(keys);
    host.commands = commandsOf(keys);
    host.disks = disksOf(keys);
    host.adapters = adaptersOf(keys);
    host.vendorLibrary = vendorLibraryOf(keys, host.adapters.size());
    if (host.vendorLibrary) {
        host.files.try_emplace("/etc/hba.conf", File{File::Kind::Content, std::string("org.simhost.hba ") +
                                                                              kVendorLibraryName + "\n"});
    }
    host.memories = memoriesOf(keys, host);
    keys.refuseUnknown();
    return host;
}

} // namespace

Host readDescription(const std::filesystem::path& path) {
    try {
        return hostOf(toml::parse_file(path.string()));
    } catch (const toml::parse_error& error) {
        throw DescriptionError(path.string() + ": line " + std::to_string(error.source().begin.line) + ": " +
                               std::string(error.description()));
    } catch (const DescriptionError& error) {
        throw DescriptionError(path.string() + ": " + error.what());
    }
}

} // namespace simhost
