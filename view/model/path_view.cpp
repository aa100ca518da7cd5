#include "view/model/path_view.hpp"

namespace view {

PathView describe(const Model& model, const Sighting& sighting) {
    switch (sighting.place) {
    case Sighting::Place::FcPath: {
        const FcPath& path = model.fc.paths[sighting.index];
        return {Tree::Fc, path.device, path.initiator, path.targetPort, std::to_string(path.lun)};
    }
    case Sighting::Place::Unlisted:
        return {Tree::Fc, model.fc.adapters[sighting.adapter].unlisted[sighting.index].device, {}, {}, {}};
    case Sighting::Place::IscsiPath: {
        const IscsiPath& path = model.iscsi.paths[sighting.index];
        return {Tree::Iscsi, path.device, path.initiatorPort, path.targetIqn + " " + path.targetAddress,
                std::to_string(path.lun)};
    }
    default:
        return {Tree::Direct, model.direct.devices[sighting.index].device, {}, {}, {}};
    }
}

} // namespace view
