// The sub-commands. Each adds itself to the command line and gives back what runs when it was chosen.
#pragma once

#include <functional>

namespace CLI
{
class App;
}

// Returns an exit code.
using VCommand = std::function<int()>;

VCommand AddDevicesCommand( CLI::App& io_rApp );
VCommand AddRecordCommand( CLI::App& io_rApp );
VCommand AddInspectCommand( CLI::App& io_rApp );
VCommand AddParamsCommand( CLI::App& io_rApp );
VCommand AddWatchCommand( CLI::App& io_rApp );
