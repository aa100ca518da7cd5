// A device that answers command by command as the input says.
//
// One answer is, in the input: host status, driver status, SCSI status, sense length (written to sb_len_wr)
// and an error number for the ioctl (0: it succeeds), one byte each; the number of response bytes, two bytes,
// little-endian; the response; and, where the sense length is not 0, 32 bytes of sense data.
#pragma once

#include <algorithm>
#include <cstring>

#include "tests/fuzz/harness.hpp"

inline int answerFrom(Input& input, sg_io_hdr& header) {
    header.host_status = input.byte();
    header.driver_status = input.byte();
    header.status = input.byte();
    header.sb_len_wr = input.byte();
    const int error = input.byte();
    respond(header, input.take(input.word()));
    if (header.sb_len_wr != 0) {
        const std::string_view sense = input.take(32);
        std::memcpy(header.sbp, sense.data(), std::min<std::size_t>(sense.size(), header.mx_sb_len));
    }
    return error;
}
