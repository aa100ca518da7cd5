#pragma once

#include <span>
#include <string_view>

namespace view {

// What a text of the log tells the reader. Progress stands for every text that carries nothing the model
// needs.
enum class Text : unsigned char {
    Progress,
    OpenEnded, // progress whose last field is foreign text that may run over several lines
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

    HbaLoadTime,
    HbaLoadFailed,
    FcBuildTime,
    FcHbaError,
    FcError,
    NoAdapters,
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
    IscsiPortEmpty,

    DeviceRegistered,
    DeviceIdFailed,
    DeviceUnsupported,
    DeviceLine,
    LogicalLine,
    NotADevice,
    SysBlockFailed,
    DasFailed,
    PartitionsFailed,
    LogicalFailed,
    PartitionLineInvalid,

    InquiryOpenFailed,
    InquiryTypeFailed,
    InquiryPage,
    FoundNaa,
    FoundT10,
    FoundEui64,
    FoundMd5,
    FoundScsiName,
    ChosenId,
    StandardInquiryId,
    PageNoDescriptor,
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
};

// Every text Morvane writes, in no particular order.
std::span<const KnownText> knownTexts();

} // namespace view
