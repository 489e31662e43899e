// SPDX-License-Identifier: Apache-2.0
#include "support/require.h"
#include "visa/Configuration.h"
#include "visa/FindExpression.h"
#include "visa/ResourceName.h"
#include "visa/formattext.h"

using namespace visa;

/// All that a caller or a configuration file hands in as text, each as a whole.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char *>(data), size);
    std::string error;
    const auto configuration = parseConfiguration(text, error);
    require(configuration.has_value() == error.empty());
    if (const auto name = parseResourceName(text)) {
        const std::string full = resourceText(*name);
        require(full.size() < VI_FIND_BUFLEN && parseResourceName(full) == name);
    }
    if (const auto pattern = FindExpression::parse(text)) {
        (void)pattern->matches("TCPIP0::192.168.1.20::inst0::INSTR");
    }
    if (const auto messages = formatMessages(text)) {
        for (const std::string &message : *messages) {
            require(!message.empty());
        }
    }
    return 0;
}
