#pragma once

#include <span>
#include <string_view>

namespace view {

// The part of a run that writes a text.
enum class Section : unsigned char {
    Any, // every part
    Run, // what frames the others
    Multipath,
    Fc,
    Iscsi,
    Direct,
    Logical,
    Inquiry, // the claiming and identifying of a device, which FC, iSCSI and direct share
};

// What a text of the log tells the reader. Progress stands for every text that carries nothing the model
// needs.
enum class Text : unsigned char {
    Progress,
    OpenEnded,       // progress whose last field is foreign text: it runs up to the next trace line
    PageDump,        // the next dump is of page 83h, or of its header
    Dump,            // the bytes of a dump follow: their number
    DumpByte,        // number, value
    AsciiDesignator, // the bytes just dumped are a descriptor, shown as text from here on
    TraceEntry,
    TraceExit,

    RunStart,
    RunEnd,
    FcBanner,
    IscsiBanner,
    DasBanner,
    LogicalBanner,
    TreeEnded,
    AssertionFailed,

    PowerPathCheck,
    PowerPathLineCount,
    PowerPathNotRunning,
    PowerPathTable,
    PowerPathEntry,

    TimeValues,
    HbaLoadTime,
    HbaLoadFailed,
    FcBuildTime,
    FcHbaError,
    FcError,
    AdapterNameFailed,
    OpeningAdapter,
    OpenAdapterFailed,
    UnsupportedAdapter,
    AdapterAttributesFailed,
    NoPorts,
    AdapterInfo,
    PortAttributesFailed,
    MappingCount,
    MappingFailed,
    MappingsFailed,
    AdapterAbandoned,
    VendorProduct,
    VendorFailed,
    LunUnnamed,
    LunDropped,
    LunIdentified,
    PseudoDevice,
    NotUnderPowerPath,
    AdapterLine,
    InitiatorLine,
    TargetLine,
    LunLine,

    IscsiPipeFailed,
    IscsiNoNameFile,
    IscsiNoName,
    IscsiStopped,
    IscsiTarget,
    IscsiPortal,
    IscsiRegister,
    IscsiIgnored,
    IscsiInitiatorLine,
    IscsiTargetLine,
    IscsiAddressLine,
    IscsiDeviceLine,

    DeviceRegistered,
    DeviceUnsupported,
    DeviceLine,
    LogicalLine,
    NotADevice,
    DasFailed,
    LogicalFailed,
    PartitionLineInvalid,

    InquiryOpenFailed,
    InquiryTypeFailed,
    InquiryPage,
    Designator,
    FoundNaa,
    FoundT10,
    FoundEui64,
    FoundMd5,
    FoundScsiName,
    ChosenId,
    StandardInquiryId,
    PageMalformed,
    PageStatus,
    PageIoctl,
    PageUnsupported,
    PageTimeOut,
    StandardTimeOut,
    StandardUnsupported,
    StandardIoctl,
    StandardStatus,
    StandardMalformed,
    StandardUnparsable,
    StandardExpired,
    ScsiStatus,
    ScsiSense,
    ScsiTransport,
    ScsiTimeOut,
    ScsiIoctl,
    ScsiInvalidOpcode,
    ScsiIllegalRequest,
};

// One text of the log as the printf format that writes it, without a leading line end; a text whose format
// here has no line end has none in the log either, and the next text stands on the same line.
struct KnownText {
    Text text;
    std::string_view format;
    Section section = Section::Any; // of texts that no part of the model needs
};

// Every text Morvane writes, in no particular order.
std::span<const KnownText> knownTexts();

} // namespace view
