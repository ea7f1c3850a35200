/// A host that writes down what the library tells it.
#pragma once

#include "common/mu_common_io_utils.h"

#include <cstdint>
#include <string>
#include <vector>

namespace support {

/// Records every call that it gets, and answers `accept` as the test says.
class RecordingIo final : public common::IoInterface {
public:
    /// `answer` is what `accept` returns, every time.
    explicit RecordingIo(std::int32_t answer = 1) : answer_(answer) {}

    /// The calls in their order: "accept <path>", "report success", "report error: <message>" (with "error 5" for a
    /// code of 5), "message <text>", "progress 1 of 2". A test that compares the whole list sees calls too many as
    /// well.
    std::vector<std::string> const& calls() const { return calls_; }

    void message(OdString const& text) const override { calls_.push_back("message " + text.ansi_str()); }

    std::int32_t accept(OdString const& path) const override
    {
        calls_.push_back("accept " + path.ansi_str());
        return answer_;
    }

    void progress(std::int64_t done, std::int64_t total) const override
    {
        calls_.push_back("progress " + std::to_string(done) + " of " + std::to_string(total));
    }

    void report(WriteOutcome const& outcome) const override { calls_.push_back("report " + inWords(outcome)); }

private:
    static std::string inWords(WriteOutcome const& outcome)
    {
        if (outcome.hasValue()) {
            return "success";
        }
        ErrorMessage const& error = outcome.error();
        std::string const code = error.code == 0 ? "" : " " + std::to_string(error.code);
        return "error" + code + ": " + error.message.ansi_str();
    }

    std::int32_t answer_;
    mutable std::vector<std::string> calls_;
};

} // namespace support
