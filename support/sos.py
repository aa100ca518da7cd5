"""The plugin by which `sos report` takes Morvane's log along."""

from sos.report.plugins import Plugin, RedHatPlugin, DebianPlugin, UbuntuPlugin, SuSEPlugin


# Each distribution by its name: Debian's sos passes over plugins that are independent of it.
class Morvane(Plugin, RedHatPlugin, DebianPlugin, UbuntuPlugin, SuSEPlugin):

    short_desc = 'Storage paths, as Morvane reports them'
    plugin_name = 'morvane'
    profiles = ('storage', 'hardware')
    commands = ('morvane',)
    plugin_timeout = 3600  # devices that do not answer take ten seconds a command

    def setup(self):
        # Morvane runs in the plugin's own folder of the report: the log, MorvaneLogs/Morvane.log, is in the archive
        # byte for byte and in full, whatever sos makes of texts and their sizes, and goes with sos' temporary folder.
        self.add_cmd_output('morvane', runat=self.get_cmd_output_path(), timeout=self.plugin_timeout)
