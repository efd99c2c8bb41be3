#pragma once

#include <gtest/gtest.h>

#include <string>
#include <string_view>

#include "diagnostics/log.h"
#include "diagnostics/log_state.h"
#include "support/debugger_output.h"
#include "support/log_text.h"
#include "support/stored_settings.h"
#include "support/temporary_folder.h"

namespace ZV::Test {

/// A log of its own for each test, with a settings store, a debugger output and room for its file.
/// The depth of nesting is 0 at the beginning.
class OpenLog : public testing::Test {
  protected:
    OpenLog() { logState.nesting = 0; }
    ~OpenLog() override {
        ZLogClose();
        Open("");
        logState.nesting = 0;
    }

    /// Opens the log with a store of these lines.
    void Open(std::string_view lines) const {
        stored.Write(lines);
        ZLogOpen();
    }
    /// The same with the log on, to its file, and with further lines.
    void OpenToFile(std::string_view lines = "") const {
        Open("outputEnabled = 1\noutputToFile = 1\noutputFilePath = " + GetFilePath() + "\n" +
             std::string(lines));
    }
    std::string GetFilePath() const { return folder.GetPath("log.txt"); }
    std::string ReadFile() const { return folder.ReadFile("log.txt"); }
    std::string ReadDebuggerOutput() const { return debugger.Read(); }
    /// The file's records for a reader.
    std::string DescribeFile() const { return DescribeLog(ReadFile()); }

    TemporaryFolder folder;
    StoredSettings stored;

  private:
    DebuggerOutput debugger;
};

}  // namespace ZV::Test
