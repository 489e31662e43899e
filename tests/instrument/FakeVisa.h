// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <deque>
#include <functional>
#include <string>
#include <vector>

/// The script and the record of the fake VISA library: one instrument that answers the standard
/// queries, and whatever else a test makes it do. A test gets at it through fakeVisa() of the same
/// shared library that the code under test has loaded.
struct FakeVisa
{
    // Script

    std::string identity = "Halvorn,TGX-870,TGX870/100001/01,1.0";
    std::string options = "TGX870-R16,TGX870-P7,TGX870-K1";
    std::deque<std::string> errors; ///< the instrument's error queue
    /// Answer to a message; called before the standard answers, which an empty text lets stand.
    std::function<std::string(const std::string &message)> answer;
    /// Status that a call is to fail or succeed with instead of doing its work; 0 lets it work.
    /// Calls are told as in `calls`.
    std::function<std::int32_t(const std::string &call)> status;
    /// At most that many bytes for the next reads; -1 for all. Good statuses stay.
    std::deque<int> readLimits;
    /// What viWrite tells less than it took.
    std::uint32_t lostCount = 0;
    std::uint16_t interfaceType = 6;
    std::vector<std::string> resources; ///< of viFindRsrc

    // Record

    /// Each call with its arguments: "viOpen GPIB0::28::INSTR", "viWrite 1024 END", "viRead 1023",
    /// "viSetAttribute 3FFF001A 5000".
    std::vector<std::string> calls;
    std::vector<std::string> messages; ///< as they were complete

    // State of the one session

    std::string input;  ///< of a message that is not complete
    std::string output; ///< what was not read yet
    bool sendsEnd = true;
    bool usesTerminator = false;
    std::uint32_t timeoutMs = 2000;
    std::uint32_t openSessions = 0;
};

extern "C" FakeVisa *fakeVisa();
