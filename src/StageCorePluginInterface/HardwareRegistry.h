// Where a module makes its kind of hardware known: manager, section of the device list, commands.
#pragma once

#include "StageCoreDataStore/DataReader.h"
#include "StageCoreDataStoreTypes/DataPath.h"

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace StageCorePluginInterface
{

class IHardwareManager;

class IHardwareRegistry
{
public:
  using VSectionPredicate = std::function<bool( const IDataReader&, const VDataPath& )>;

  virtual void RegisterManager( std::shared_ptr<IHardwareManager> i_pManager ) = 0;
  virtual void UnregisterManager( const std::shared_ptr<IHardwareManager>& i_pManager ) = 0;
  // The data-store path at which a section begins.
  virtual void SetSectionRoot( const std::string& i_rSection, const VDataPath& i_rPath ) = 0;
  virtual void AddSection( const std::string& i_rSection, VSectionPredicate i_Predicate, int i_SortPosition ) = 0;
  virtual void AddCommand( const std::string& i_rKey, const std::vector<std::string>& i_rSections, const std::string& i_rText,
    const std::string& i_rShortcut ) = 0;
  virtual ~IHardwareRegistry() = default;
};

// The host's hardware object; the module asks it for the registry, its ninth operation.
class IHardwareHost
{
public:
  virtual void Reserved1() {}
  virtual void Reserved2() {}
  virtual void Reserved3() {}
  virtual void Reserved4() {}
  virtual void Reserved5() {}
  virtual void Reserved6() {}
  virtual void Reserved7() {}
  virtual void Reserved8() {}
  virtual std::shared_ptr<IHardwareRegistry> GetHardwareRegistry() = 0;
  virtual ~IHardwareHost() = default;
};

}
