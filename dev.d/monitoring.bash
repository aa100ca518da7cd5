# shellcheck shell=bash
# The programs of Prometheus that the tests of monitoring/ start. Installed, Debian's packages would start services.

# unpack_monitoring: unpacks them into build/monitoring, unless they are there.
unpack_monitoring() {
    local target=$PWD/build/monitoring download=$scratch/monitoring
    [ -x "$target/usr/bin/prometheus-node-exporter" ] && return
    mkdir -p "$target" "$download"
    as_root apt-get update -qq || true
    (cd "$download" && apt-get -qq -o APT::Sandbox::User=root download prometheus prometheus-node-exporter)
    dpkg-deb --extract "$download"/prometheus_*.deb "$target"
    dpkg-deb --extract "$download"/prometheus-node-exporter_*.deb "$target" # the last: it marks the end
}
