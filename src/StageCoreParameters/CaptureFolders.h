// The folders that captures may go to, by the aliases that the host gives them.
#pragma once

#include "NotificationSystem/MultiCallback.h"

#include <string>
#include <vector>

namespace StageCorePluginInterface
{

class ICaptureFolders
{
public:
  virtual ~ICaptureFolders() = default;
  // The folder aliases that a device may choose among, in the order of the list.
  virtual void GetFolderAliases( std::vector<std::string>& o_rAliases ) = 0;
  virtual KVZ::IMultiCallbackPostal<void()>& GetFolderAliasesChangedCallback() = 0;
};

}
