#pragma once

#include <memory>
#include <string_view>

namespace sorn::tools {

/// Shows messages on standard output, and words about what is none on standard error, without ever waiting
/// for who reads them: a thread of its own writes. What it has not written yet is bounded; beyond, whole
/// messages are left out, and standard error is told how many as soon as the reader has caught up, or at the
/// end. One thread but for its own.
class TraceWriter {
 public:
    TraceWriter();
    /// Waits for the reader as long as it takes something within each second; the rest is left out.
    ~TraceWriter();
    TraceWriter(const TraceWriter&) = delete;
    TraceWriter& operator=(const TraceWriter&) = delete;

    void Show(std::string_view message);

 private:
    struct State;

    static void Run(const std::shared_ptr<State>& state);

    std::shared_ptr<State> stateM;  // the thread's, too, which may hang in a write when all else has ended
};

}  // namespace sorn::tools
