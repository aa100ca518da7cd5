#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>

#include <gtest/gtest.h>

#include "tests/support/process.hpp"

namespace test {
namespace {

namespace fs = std::filesystem;

// A described host, in which programs are run.
class SimHost {
public:
    explicit SimHost(const std::string& description) {
        std::ofstream(mScratch.path() / "host.toml") << description;
        fs::create_directory(work());
    }

    [[nodiscard]] fs::path work() const { return mScratch.path() / "work"; }
    [[nodiscard]] fs::path kept() const { return mScratch.path() / "kept"; }
    [[nodiscard]] std::string record() const { return contentOf(mScratch.path() / "record"); }

    [[nodiscard]] ProcessResult run(const std::vector<std::string>& program) const {
        std::vector<std::string> arguments = {SIMHOST_PROGRAM,
                                              mScratch.path() / "host.toml",
                                              "--record",
                                              mScratch.path() / "record",
                                              "--keep",
                                              kept(),
                                              "--"};
        arguments.insert(arguments.end(), program.begin(), program.end());
        return runProcess(arguments, work());
    }

    // What a shell prints there, errors included.
    [[nodiscard]] std::string shell(const std::string& script) const {
        return run({"/bin/sh", "-c", "exec 2>&1; " + script}).output;
    }

private:
    TemporaryDirectory mScratch;
};

const std::string kStandardInquiry = "120000002400";
const std::string kPage00 = "12010000ff00";
const std::string kPage80 = "128080000400";
const std::string kPage83 = "12018300ff00";

// ---- Disks, asked by programs of both word sizes ----

class Disks : public testing::TestWithParam<const char*> {
protected:
    static std::string ask(const SimHost& host, const std::vector<std::string>& commands) {
        std::vector<std::string> program = {GetParam()};
        program.insert(program.end(), commands.begin(), commands.end());
        const ProcessResult result = host.run(program);
        return result.output + result.error;
    }
};

INSTANTIATE_TEST_SUITE_P(WordSizes, Disks, testing::Values(SG_PROBE_64, SG_PROBE_32),
                         [](const auto& program) { return program.index == 0 ? "bits64" : "bits32"; });

TEST_P(Disks, answerStandardDataAndPages) {
    const SimHost host(R"(
        [[disk]]
        node = "/dev/sda"
        type = 0x0c
        vendor = "ATA"
        product = "A product of more than sixteen"
        revision = "1.0"
        tail = "aabb"
        serial = "S123"
        designators = [
            { type = 3, hex = "5000c500 1a2b3c4d" },
            { type = 8, text = "name", association = 1, code_set = 3 },
        ]
    )");
    EXPECT_EQ(ask(host, {"/dev/sda", kStandardInquiry, "/dev/sda", "12000000ff00", "/dev/sda", "12018000ff00",
                         "/dev/sda", kPage83, "/dev/sda", "120183000400"}),
              "/dev/sda: status 0 host 0 driver 0 resid 28 sense 0: data "
              "0c000502210000024154412020202020412070726f64756374206f66206d6f72312e3020\n"
              "/dev/sda: status 0 host 0 driver 0 resid 26 sense 0: data "
              "0c000502210000024154412020202020412070726f64756374206f66206d6f72312e3020aabb\n"
              "/dev/sda: status 0 host 0 driver 0 resid 56 sense 0: data 0c80000453313233\n"
              "/dev/sda: status 0 host 0 driver 0 resid 40 sense 0: data "
              "0c830014010300085000c5001a2b3c4d031800046e616d65\n"
              "/dev/sda: status 0 host 0 driver 0 resid 60 sense 0: data 0c830014\n");
}

TEST_P(Disks, putProtocolAndItsValidityIntoADesignator) {
    const SimHost host(R"(
        [[disk]]
        node = "/dev/sda"
        designators = [
            { type = 4, hex = "00000001", association = 1, piv = true, protocol = 6 },
            { type = 8, text = "n", association = 2, protocol = 15 },
            { type = 3, hex = "50", piv = true },
        ]
    )");
    EXPECT_EQ(ask(host, {"/dev/sda", kPage83}), "/dev/sda: status 0 host 0 driver 0 resid 42 sense 0: data "
                                                "008300126194000400000001f22800016e0183000150\n");
}

TEST_P(Disks, listThePagesThatTheyAnswer) {
    const SimHost host(R"(
        [[disk]]
        node = "/dev/sda"
        type = 0x0c
        serial = "S"
        designators = []
        raw = { 0xb1 = "0cb10000", 0x01 = "0c010000" }
        [[disk]]
        node = "/dev/sdb"
        serial = "S"
        raw = { 0x00 = "00000001ff" }
        [[disk]]
        node = "/dev/sdc"
    )");
    EXPECT_EQ(
        ask(host, {"/dev/sda", kPage00, "/dev/sdb", kPage00, "/dev/sdc", kPage00}),
        "/dev/sda: status 0 host 0 driver 0 resid 55 sense 0: data 0c00000500018083b1\n"
        "/dev/sdb: status 0 host 0 driver 0 resid 59 sense 0: data 00000001ff\n"
        "/dev/sdc: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000240000000000 data \n");
}

TEST_P(Disks, refuseWhatIsNotDescribedAsDevicesDo) {
    const SimHost host("[[disk]]\nnode = '/dev/sda'\n");
    EXPECT_EQ(
        ask(host, {"/dev/sda", kPage83, "/dev/sda", "000000000000", "/dev/sda", "120083002400"}),
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000240000000000 data \n"
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000200000000000 data \n"
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000240000000000 data \n");
}

TEST_P(Disks, sendNoMoreThanFits) {
    const SimHost host(R"(
        [[disk]]
        node = "/dev/sda"
        raw = { standard = "000102030405060708090a0b0c0d0e0f101112131415161718191a1b1c1d1e1f202122232425" }
        [[disk]]
        node = "/dev/sdb"
        ignores_allocation_length = true
        raw = { 0x80 = "0080000401020304" }
    )");
    EXPECT_EQ(ask(host, {"/dev/sda", "120000000200", "/dev/sdb", "120180000200"}),
              "/dev/sda: status 0 host 0 driver 0 resid 62 sense 0: data 0001\n"
              "/dev/sdb: status 0 host 0 driver 0 resid 56 sense 0: data 0080000401020304\n");
}

TEST_P(Disks, failAsDescribedAndWhenDescribed) {
    const SimHost host(R"(
        [[disk]]
        node = ["/dev/sda", "/dev/sdb"]
        raw = { standard = "00", 0x83 = "0083" }
        faults = [
            { command = "standard", nth = 2, errno = "EIO" },
            { command = "standard", from = 4, host_status = 3 },
            { command = "0x83", status = 2, driver_status = 8, sense = "7206", sense_length = 32, data = "ff" },
            { nth = 6, resid = -1 },
        ]
    )");
    EXPECT_EQ(
        ask(host, {"/dev/sda", kStandardInquiry, "/dev/sda", kStandardInquiry, "/dev/sda", kStandardInquiry,
                   "/dev/sda", kStandardInquiry, "/dev/sdb", kStandardInquiry, "/dev/sda", kPage83}),
        "/dev/sda: status 0 host 0 driver 0 resid 63 sense 0: data 00\n"
        "/dev/sda: ioctl: Input/output error\n"
        "/dev/sda: status 0 host 0 driver 0 resid 63 sense 0: data 00\n"
        "/dev/sda: status 0 host 3 driver 0 resid 64 sense 0: data \n"
        "/dev/sdb: status 0 host 0 driver 0 resid 63 sense 0: data 00\n"
        "/dev/sda: status 2 host 0 driver 8 resid 63 sense 32:7206 data ff\n");
    EXPECT_EQ(
        ask(host, {"/dev/sda", "0000", "/dev/sda", "0000", "/dev/sda", "0000", "/dev/sda", "0000", "/dev/sda",
                   "0000", "/dev/sda", kStandardInquiry}),
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000200000000000 data \n"
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000200000000000 data \n"
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000200000000000 data \n"
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000200000000000 data \n"
        "/dev/sda: status 2 host 0 driver 8 resid 64 sense 18:700005000000000a00000000200000000000 data \n"
        "/dev/sda: status 0 host 0 driver 0 resid -1 sense 0: data 00\n");
}

TEST_P(Disks, answerLate) {
    const SimHost host("[[disk]]\nnode = '/dev/sda'\nfaults = [{ delay_ms = 300, errno = 19 }]\n");
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(ask(host, {"/dev/sda", kStandardInquiry}), "/dev/sda: ioctl: No such device\n");
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(300));
}

TEST_P(Disks, cannotBeOpenedWhenDescribedSo) {
    const SimHost host(R"(
        disk = [
            { node = "/dev/a", open_error = "ENOENT" },
            { node = "/dev/b", open_error = "ENXIO" },
            { node = "/dev/c", open_error = "ELOOP" },
        ]
    )");
    EXPECT_EQ(ask(host, {"/dev/a", "", "/dev/b", "", "/dev/c", "", "/dev/null", kStandardInquiry}),
              "/dev/a: open: No such file or directory\n"
              "/dev/b: open: No such device or address\n"
              "/dev/c: open: Too many levels of symbolic links\n"
              "/dev/null: ioctl: Inappropriate ioctl for device\n");
}

TEST_P(Disks, areRecorded) {
    const SimHost host("[[disk]]\nnode = '/dev/cciss/c0d0'\n");
    ask(host, {"/dev/cciss/c0d0", kPage83, "/dev/null", kStandardInquiry});
    EXPECT_EQ(host.record(),
              "SG_IO /dev/cciss/c0d0 cdb=12018300ff00 dxfer_len=64 dxfer_direction=-3 mx_sb_len=32 "
              "timeout=1500\n"
              "SG_IO - cdb=120000002400 dxfer_len=64 dxfer_direction=-3 mx_sb_len=32 timeout=1500\n");
}

TEST_P(Disks, comeInNumbers) {
    const SimHost host(R"(
        [[disk]]
        count = 3
        first = 9
        node = "/dev/sd{n}"
        raw = { standard = "{n:08x}", 0x80 = "{n:04}" }
        [[disk]]
        node = "/dev/{n}"
        raw = { standard = "00" }
    )");
    EXPECT_EQ(ask(host, {"/dev/sd9", "120180000400", "/dev/sd10", "120180000400", "/dev/sd11",
                         kStandardInquiry, "/dev/sd12", "", "/dev/{n}", kStandardInquiry}),
              "/dev/sd9: status 0 host 0 driver 0 resid 62 sense 0: data 0009\n"
              "/dev/sd10: status 0 host 0 driver 0 resid 62 sense 0: data 0010\n"
              "/dev/sd11: status 0 host 0 driver 0 resid 60 sense 0: data 0000000b\n"
              "/dev/sd12: open: No such file or directory\n"
              "/dev/{n}: status 0 host 0 driver 0 resid 63 sense 0: data 00\n");
}

// ---- The host around them ----

TEST(SimHostFiles, areAbsentUnlessDescribed) {
    const SimHost host("");
    EXPECT_EQ(
        host.shell("hostname; ls /sys /sys/block; cat /proc/partitions; ls /dev;"
                   "ls /etc/hba.conf /etc/iscsi/initiatorname.iscsi /sbin/iscsiadm /sbin/powermt | wc -l;"
                   "pgrep -l init; echo $?"),
        "simhost\n/sys:\nblock\n\n/sys/block:\nmajor minor  #blocks  name\n\n"
        "fd\nfull\nnull\nrandom\nshm\nstderr\nstdin\nstdout\ntty\nurandom\nzero\n"
        "ls: cannot access '/etc/hba.conf': No such file or directory\n"
        "ls: cannot access '/etc/iscsi/initiatorname.iscsi': No such file or directory\n"
        "ls: cannot access '/sbin/iscsiadm': No such file or directory\n"
        "ls: cannot access '/sbin/powermt': No such file or directory\n"
        "0\n1\n");
}

TEST(SimHostFiles, haveTheDescribedContentOrError) {
    const SimHost host(R"(
        hostname = "oak"
        [files]
        "/etc/iscsi/initiatorname.iscsi" = "InitiatorName=iqn.x\n"
        "/etc/hba.conf" = { hex = "41 ff 0a" }
        "/etc/one" = { error = "open" }
        "/etc/two" = { error = "read" }
        "/etc/passwd" = { missing = true }
        "/odd" = { link = "etc/hba.conf" }
        "/proc/partitions" = { error = "read" }
    )");
    EXPECT_EQ(
        host.shell("LC_ALL=C; export LC_ALL; hostname; cat /etc/iscsi/initiatorname.iscsi; od -An -tx1 /odd;"
                   "cat /etc/one /etc/two /etc/passwd /proc/partitions; readlink /odd"),
        "oak\nInitiatorName=iqn.x\n 41 ff 0a\n"
        "cat: /etc/one: No such device or address\n"
        "cat: /etc/two: Input/output error\n"
        "cat: /etc/passwd: No such file or directory\n"
        "cat: /proc/partitions: Input/output error\n"
        "etc/hba.conf\n");
}

TEST(SimHostFiles, listPartitionsAsTheKernelDoes) {
    const SimHost host("partitions = ['sda', 'cciss/c0d0p1', { name = 'dm-{n}', count = 2 }]\n");
    EXPECT_EQ(host.shell("cat /proc/partitions"), "major minor  #blocks  name\n\n"
                                                  "   8        0   10485760 sda\n"
                                                  "   8        1   10485760 cciss/c0d0p1\n"
                                                  "   8        2   10485760 dm-0\n"
                                                  "   8        3   10485760 dm-1\n");
}

TEST(SimHostFiles, showSysBlockInTheDescribedOrderAndKind) {
    const SimHost host(R"(
        sys_block = [
            "../devices/z/block/sdz",
            { link = "../devices/{n}/block/a{n}", count = 2 },
            { name = "older", device = "../../devices/x" },
            { name = "cciss!c0d0", type = "file" },
            { name = "pipe", type = "fifo" },
            { name = "sock", type = "socket" },
            { name = "dir", type = "directory" },
        ]
    )");
    EXPECT_EQ(
        host.shell("ls -U /sys/block; cd /sys/block; readlink sdz a0 a1 older/device; stat -c %F *"),
        "sdz\na0\na1\nolder\ncciss!c0d0\npipe\nsock\ndir\n"
        "../devices/z/block/sdz\n../devices/0/block/a0\n../devices/1/block/a1\n../../devices/x\n"
        "symbolic link\nsymbolic link\nregular empty file\ndirectory\ndirectory\nfifo\nsymbolic link\nsocket\n");
    EXPECT_EQ(SimHost("sys_block = false\n").shell("ls /sys/block"),
              "ls: cannot access '/sys/block': No such file or directory\n");
}

TEST(SimHostCommands, answerCallByCallAndAreRecorded) {
    const SimHost host(R"(
        [commands]
        "/sbin/iscsiadm" = ["one\n", { output = "two\n", error = "no more\n", status = 21 }, ""]
        "/usr/bin/pgrep" = { missing = true }
        "/sbin/powermt" = { hex = "00ff" }
    )");
    EXPECT_EQ(host.shell("for i in 1 2 3 4; do /sbin/iscsiadm -m \"a  b\"; echo $?; done;"
                         "/sbin/powermt display | od -An -tx1; /usr/bin/pgrep x"),
              "one\n0\ntwo\nno more\n21\n0\n0\n 00 ff\n/bin/sh: 1: /usr/bin/pgrep: not found\n");
    EXPECT_EQ(host.record(),
              "run /sbin/iscsiadm -m a  b\nrun /sbin/iscsiadm -m a  b\nrun /sbin/iscsiadm -m a  b\n"
              "run /sbin/iscsiadm -m a  b\nrun /sbin/powermt display\n");
}

TEST(SimHostAdapters, reachTheProgramThroughTheHbaApiLibrary) {
    const SimHost host(R"(
        [[adapter]]
        name = "%s-0"
        manufacturer = "0123456789012345678901234567890123456789012345678901234567890123 and more"
        model = "M"
        wwnn = "20:00:00:1b:32:0a:11:22"
        ports = ["21:00:00:1b:32:0a:11:22"]
        number_of_ports = 2
        port_status = [0, 0]
        mapping = [{}, { status = 11, entries = 1000 }]
        [[adapter.target]]
        wwnn = "50:06:01:60:c1:e0:12:34"
        wwpn = "50060161 41e01234"
        bus = 1
        id = 2
        fcid = 0x010200
        luns = ["/dev/sdb", { device = "/dev/sd{n}", lun = 7, fcp_lun = 0x1000000000000, count = 2 }, ""]
        [[adapter]]
        open = false
        [[adapter]]
        name_status = 1
        [[adapter]]
        name = "%s-0"
        [[adapter]]
        name = "attributes"
        attributes_status = 2
        ports = ["2100001b320a1122"]
        port_status = [12]
    )");
    const ProcessResult result = host.run({HBA_PROBE});
    EXPECT_EQ(result.error, "");
    EXPECT_EQ(
        result.output,
        "load: status 0\n"
        "adapter 0: status 0 <%s-0>\n"
        "  attributes: status 0 <0123456789012345678901234567890123456789012345678901234567890123> <M> 2 ports "
        "2000001b320a1122\n"
        "  port 0: status 0 2100001b320a1122\n"
        "  port 1: status 0 0000000000000000\n"
        "  mapping of 1: status 7, 4 entries\n"
        "    /dev/sdb bus 1 target 2 lun 0 fcid 10200 fcplun 0 50060160c1e01234 5006016141e01234\n"
        "  mapping of 8: status 11, 1000 entries\n"
        "    /dev/sdb bus 1 target 2 lun 0 fcid 10200 fcplun 0 50060160c1e01234 5006016141e01234\n"
        "    /dev/sd0 bus 1 target 2 lun 7 fcid 10200 fcplun 1000000000000 50060160c1e01234 5006016141e01234\n"
        "    /dev/sd1 bus 1 target 2 lun 8 fcid 10200 fcplun 1000000000001 50060160c1e01234 5006016141e01234\n"
        "adapter 1: status 0 <simhba-1>\n"
        "  not opened\n"
        "adapter 2: status 1 <>\n"
        "  not opened\n"
        "adapter 3: status 0 <attributes>\n"
        "  attributes: status 2 <> <> 1 ports 0000000000000000\n"
        "  port 0: status 12 2100001b320a1122\n"
        "  mapping of 1: status 0, 0 entries\n"
        "  mapping of 8: status 0, 0 entries\n"
        "free: status 0\n");
}

TEST(SimHostAdapters, mayBeMissingInSeveralWays) {
    EXPECT_EQ(SimHost("").run({HBA_PROBE}).output,
              "Cannot open /etc/hba.conf\nload: status 1\nfree: status 1\n");
    EXPECT_EQ(SimHost("[fc]\n").run({HBA_PROBE}).output, "load: status 0\nfree: status 0\n");
    EXPECT_EQ(SimHost("[fc]\nload_status = 1\n").run({HBA_PROBE}).output, "load: status 1\nfree: status 0\n");
    EXPECT_EQ(SimHost("[fc]\nregister_status = 1\n").run({HBA_PROBE}).output,
              "load: status 1\nfree: status 0\n");
    EXPECT_EQ(SimHost("[fc]\nadapters = 1\n").run({HBA_PROBE}).output,
              "load: status 0\nadapter 0: status 6 <>\n  not opened\nfree: status 0\n");
}

// ---- The real machine ----

// All that the host below replaces, and the mounts.
std::string realMachine() {
    return runProcess(
               {"/bin/sh", "-c",
                "hostname; cat /proc/partitions /etc/hostname /proc/self/mountinfo; ls -a / /dev /sys/block;"
                "ls -l /usr/bin/env /etc/group /etc/passwd; ls -d /etc/new /etc/iscsi /sbin/iscsiadm"},
               "/")
        .output;
}

TEST(SimHostLeavesTheRealMachine, asItWas) {
    const std::string before = realMachine();
    const SimHost host(R"(
        hostname = "oak"
        sys_block = ["../devices/a/sda"]
        partitions = ["sda"]
        [files]
        "/etc/new" = "new"
        "/etc/iscsi/initiatorname.iscsi" = "x"
        "/etc/passwd" = { missing = true }
        "/odd" = "odd"
        [commands]
        "/sbin/iscsiadm" = "x"
        [[disk]]
        node = "/dev/sda"
        [fc]
    )");
    EXPECT_EQ(
        host.shell(
            "rm /usr/bin/env /etc/group; echo x >/etc/hostname; mkdir /dev/x; hostname y; mount -t tmpfs "
            "none /usr/share; echo done"),
        "done\n");
    EXPECT_EQ(realMachine(), before);
}

TEST(SimHostLeavesTheRealMachine, withoutTheProgramsProcesses) {
    const SimHost host("");
    const fs::path mark = host.work() / "alive";
    EXPECT_EQ(host.shell("(while :; do touch alive; sleep 0.05; done) & sleep 0.2; ls; echo $$"),
              "alive\n2\n");
    fs::remove(mark); // its maker ended with the host
    ::usleep(200000);
    EXPECT_FALSE(fs::exists(mark));
}

TEST(SimHostProgram, keepsItsDirectoryArgumentsAndStatus) {
    const SimHost host("");
    const ProcessResult result = host.run(
        {"/bin/sh", "-c", "pwd; echo $*; echo e >&2; echo f >file; exit 42", "sh", "--", "[a,b]", "--keep"});
    EXPECT_EQ(result.output, host.work().string() + "\n-- [a,b] --keep\n");
    EXPECT_EQ(result.error, "e\n");
    EXPECT_EQ(result.status, 42);
    EXPECT_EQ(contentOf(host.work() / "file"), "f\n");
    EXPECT_EQ(host.run({"/bin/sh", "-c", "kill -SEGV $$"}).status, 128 + 11);
    const ProcessResult missing = host.run({"/no/such/program"});
    EXPECT_EQ(missing.status, 127);
    EXPECT_EQ(missing.error, "simhost: /no/such/program: No such file or directory\n");
}

TEST(SimHostProgram, hasNoDescriptorOfSimhost) {
    const std::vector<std::string> listing = {"/bin/ls", "/proc/self/fd"};
    EXPECT_EQ(SimHost("").run(listing).output, runProcess(listing, "/").output);
}

TEST(SimHostKeeps, whatItMade) {
    const SimHost host("[files]\n'/etc/hba.conf' = 'c'\n[[disk]]\nnode = '/dev/cciss/c0d0'\n");
    EXPECT_EQ(host.run({"/bin/true"}).status, 0);
    EXPECT_EQ(contentOf(host.kept() / "etc/hba.conf"), "c");
    EXPECT_TRUE(fs::exists(host.kept() / "dev/cciss/c0d0"));
    EXPECT_TRUE(fs::exists(host.kept() / "sys/block"));
}

// ---- Descriptions that cannot be used ----

std::string complaint(const std::string& description) {
    const ProcessResult result = SimHost(description).run({"/bin/true"});
    EXPECT_EQ(result.status, 125);
    const std::size_t place =
        result.error.find("host.toml: "); // what stands before it is the test's own path
    return place == std::string::npos ? result.error : result.error.substr(place);
}

TEST(SimHostDescription, isRefusedWhereItIsWrong) {
    EXPECT_EQ(complaint("hostnam = 'x'\n"), "host.toml: line 1: host: unknown key \"hostnam\"\n");
    EXPECT_EQ(complaint("\n[[disk]]\nvendor = 'x'\n"), "host.toml: disk 0: has no \"node\"\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/tmp/x'\n"),
              "host.toml: disk 0.node: must stand under /dev: \"/tmp/x\"\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nraw = { 0x83 = '0' }\n"),
              "host.toml: disk 0.raw: an odd number of hex digits\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nfaults = [{ errno = 'ENONSENSE' }]\n"),
              "host.toml: disk 0.faults: must be the name or number of a system error\n");
    EXPECT_EQ(
        complaint("[files]\n'/usr/x' = ''\n"),
        "host.toml: line 2: /usr/x: files stand under /etc or directly under /, or are /proc/partitions\n");
    EXPECT_EQ(complaint("[commands]\n'/bin/ls' = ''\n"),
              "host.toml: line 2: /bin/ls: commands are /sbin/iscsiadm, /usr/bin/pgrep and /sbin/powermt\n");
    EXPECT_EQ(complaint("[[adapter]]\nwwnn = '00'\n"), "host.toml: adapter 0.wwnn: a WWN has 8 bytes\n");
    EXPECT_EQ(complaint("[[adapter]]\nname = '" + std::string(256, 'x') + "'\n"),
              "host.toml: adapter 0: a name has at most 255 bytes\n");
}

TEST(SimHostDescription, isRefusedWhereAValueHasAnotherType) {
    EXPECT_EQ(complaint("partitions = [{ name = 5 }]\n"), "host.toml: partitions 0.name: must be a string\n");
    EXPECT_EQ(complaint("[files]\n'/etc/x' = { missing = false }\n"),
              "host.toml: line 2: /etc/x.missing: can only be true\n");
    EXPECT_EQ(complaint("[files]\n'/etc/x' = { missing = 1 }\n"),
              "host.toml: line 2: /etc/x.missing: must be true or false\n");
    EXPECT_EQ(complaint("[commands]\n'/usr/bin/pgrep' = { missing = 1 }\n"),
              "host.toml: line 2: /usr/bin/pgrep.missing: must be true or false\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = ['/dev/x', 5]\n"), "host.toml: disk 0.node: must be a string\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = 5\n"),
              "host.toml: disk 0.node: must be a path or a list of paths\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nraw = { 0x83 = 83 }\n"),
              "host.toml: disk 0.raw: must be a string\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nfaults = [{ command = 0x83 }]\n"),
              "host.toml: disk 0.faults.command: must be a string\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nfaults = [{ resid = 1.0 }]\n"),
              "host.toml: disk 0.faults.resid: must be a 32-bit number\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\ndesignators = [{ type = 3, hex = '', piv = 1 }]\n"),
              "host.toml: disk 0.designators.piv: must be true or false\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\ndesignators = [{ type = 3, hex = '', protocol = 16 }]\n"),
              "host.toml: disk 0.designators.protocol: must be a number from 0 to 15\n");
    EXPECT_EQ(complaint("[[adapter]]\nports = [5]\n"), "host.toml: adapter 0.ports: must be a string\n");
    EXPECT_EQ(complaint("[[adapter]]\nport_status = ['x']\n"),
              "host.toml: adapter 0.port_status: must be a number from 0 to 4294967295\n");
    EXPECT_EQ(complaint("[[adapter]]\nport_status = [-1]\n"),
              "host.toml: adapter 0.port_status: must be a number from 0 to 4294967295\n");
    EXPECT_EQ(complaint("[[adapter]]\nmapping = [7]\n"), "host.toml: adapter 0.mapping: must be a table\n");
}

TEST(SimHostDescription, isRefusedWhereAValueDoesNotFitItsField) {
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nfaults = [{ nth = 0 }]\n"),
              "host.toml: disk 0.faults: commands count from 1\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nfaults = [{ from = 0 }]\n"),
              "host.toml: disk 0.faults: commands count from 1\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nfaults = [{ delay_ms = 2147483648 }]\n"),
              "host.toml: disk 0.faults.delay_ms: must be a number from 0 to 2147483647\n");
    const std::string tail(450, '0');
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\ntail = '" + tail + "'\n"),
              "host.toml: disk 0: a tail of more than 224 bytes needs \"additional_length\"\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/x'\nserial = '" + std::string(65536, 'x') + "'\n"),
              "host.toml: disk 0: a page has at most 65535 bytes\n");
    EXPECT_EQ(complaint("partitions = [{ name = 'sd{n:099}', count = 1 }]\n"),
              "host.toml: partitions 0: a placeholder has at most 20 digits\n");
    EXPECT_EQ(complaint("partitions = [{ name = 'sd{n}', count = 1000001 }]\n"),
              "host.toml: line 1: partitions 0.count: must be a number from 0 to 1000000\n");
}

// The directories around the described ones are the real machine's.
TEST(SimHostDescription, isRefusedWhereAPathLeavesItsPlace) {
    EXPECT_EQ(complaint("[files]\n'/etc/../tmp/morvane-test' = ''\n"),
              "host.toml: line 2: /etc/../tmp/morvane-test: a path has no empty, \".\" or \"..\" part\n");
    EXPECT_EQ(complaint("[files]\n'/..' = ''\n"),
              "host.toml: line 2: /..: a path has no empty, \".\" or \"..\" part\n");
    EXPECT_EQ(complaint("[[disk]]\nnode = '/dev/../tmp/morvane-test'\n"),
              "host.toml: disk 0.node: must stand under /dev: \"/dev/../tmp/morvane-test\"\n");
    EXPECT_EQ(complaint("sys_block = [{ name = '../x', type = 'file' }]\n"),
              "host.toml: sys_block 0: no name of an entry: \"../x\"\n");
    EXPECT_EQ(complaint("sys_block = ['..']\n"),
              "host.toml: line 1: sys_block 0: no name of an entry: \"..\"\n");
}

// ---- The command line ----

TEST(SimHostProgram, saysHowItIsCalled) {
    const ProcessResult help = runProcess({SIMHOST_PROGRAM, "--help"}, "/");
    EXPECT_EQ(help.output, R"(Runs a program on a simulated host.
Usage: simhost [OPTIONS] HOST

Positionals:
  HOST TEXT REQUIRED          the description of the host, TOML

Options:
  -h,--help                   Print this help message and exit
  --record FILE               write what the program asks of the host to FILE
  --keep DIR                  copy the files that are made for the host into DIR
  --memory DIR                write what the kernel and multipath remember into folders of DIR; no program is needed then

The program and its arguments follow behind --:
  simhost HOST.toml [OPTIONS] -- PROGRAM [ARGUMENT...]
)");
    EXPECT_EQ(help.error, "");
    EXPECT_EQ(help.status, 0);
}

TEST(SimHostProgram, refusesACommandLineThatItDoesNotUnderstand) {
    const auto refusal = [](const std::vector<std::string>& arguments) {
        std::vector<std::string> command = {SIMHOST_PROGRAM};
        command.insert(command.end(), arguments.begin(), arguments.end());
        const ProcessResult result = runProcess(command, "/");
        EXPECT_EQ(result.output, "");
        EXPECT_EQ(result.status, 2);
        const std::string hint = "Run with --help for more information.\n";
        EXPECT_TRUE(result.error.ends_with(hint)) << result.error;
        return result.error.substr(0, result.error.size() - std::min(result.error.size(), hint.size()));
    };
    EXPECT_EQ(refusal({}), "HOST is required\n");
    EXPECT_EQ(refusal({"--", "/bin/true"}), "HOST is required\n");
    EXPECT_EQ(refusal({"host.toml"}), "-- PROGRAM is required\n");
    EXPECT_EQ(refusal({"host.toml", "--"}), "-- PROGRAM is required\n");
    EXPECT_EQ(refusal({"host.toml", "--record", "--", "/bin/true"}), "--record: 1 required FILE missing\n");
    EXPECT_EQ(refusal({"host.toml", "--recrod=x", "--", "/bin/true"}),
              "The following argument was not expected: --recrod=x\n");
    EXPECT_EQ(refusal({"host.toml", "other.toml", "--", "/bin/true"}),
              "The following argument was not expected: other.toml\n");
}

} // namespace
} // namespace test
