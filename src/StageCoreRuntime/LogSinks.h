// Where log records end up: console and rotating file, lines that repeat folded. The one place that knows the logging library.
#pragma once

#include "StageCoreRuntime/GlobalLog.h"

namespace KVZ::Detail
{
// Fixed after construction. Both operations may be called from any thread.
class VLogSinks
{
public:
  explicit VLogSinks( const VLogOptions& i_rOptions );
  ~VLogSinks();

  bool HasFile() const;
  // Why the file could not be opened; empty if it could, or if none was asked for.
  const std::string& FileFailure() const;

  void WriteToConsole( const VLogRecord& i_rRecord );
  void WriteToFile( const VLogRecord& i_rRecord );

private:
  struct VImpl;
  const std::unique_ptr<VImpl> m_pImpl;
};
}
