// Owns the parameters of one thing in the data store: makes them, registers them with the host, and reacts to them.
//
// Made through MakeShared. Reactions are bound weakly and run on the thread of the postal service given at construction.
#pragma once

#include "StageCoreParameters/Parameter.h"
#include "StageCoreParameters/ParameterGroup.h"
#include "StageCoreParameters/ParameterRegistry.h"
#include "StageCoreRuntime/Shared.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

// What a parameter is beside its value.
struct VParameterText
{
  const char* m_pCategory;
  const char* m_pDisplay;
  const char* m_pDescription;
};

// Bits, for AddParameter.
namespace ParameterTraits
{
constexpr uint32_t ReadOnly = 1;
constexpr uint32_t Hidden = 2;
constexpr uint32_t Advanced = 4;
constexpr uint32_t VerifyRequired = 8;
}

class VStageCoreParameterHandler : public KVZ::VShared
{
public:
  VStageCoreParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService, std::shared_ptr<IDataStore> i_pDataStore,
    std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry, const VDataPath& i_rPath, const VDataPath& i_rAttributePath );

  // Makes the parameters under one write lock and registers the group.
  void PostConstruct() override;
  // Takes the group out of the registry.
  void PreDestruct() override;

  // Under the write lock.
  virtual void CreateParameters() = 0;
  virtual const VDataPath& GetPath() const { return m_pParameterGroup->GetPath(); }
  // After each accepted write of "Connected".
  virtual void OnConnectedChanged() {}
  // On a proposed value of "Enabled".
  virtual void OnEnabledChanged() {}

  // Asserts that there is one.
  std::shared_ptr<VParameter> GetParameter( const std::string& i_rKey ) const;

protected:
  // Makes a parameter whose value lies at the path.
  template<class T>
  VParameter& AddParameter( const VDataPath& i_rPath, const VParameterText& i_rText, uint32_t i_Traits = 0 )
  {
    return AddParameterOf( GetParameterChecker<T>(), i_rPath, i_rText, i_Traits );
  }

  // The value that counts. False, with the output left alone, where there is none of this type.
  template<class T>
  bool Read( const std::string& i_rKey, T& o_rValue ) const
  {
    KVZ::Variant Value;
    const std::shared_ptr<VParameter> pParameter = GetParameter( i_rKey );
    return pParameter && pParameter->GetValue( Value ) && Value.Get( o_rValue );
  }
  template<class T>
  T ReadOr( const std::string& i_rKey, T i_Fallback ) const
  {
    Read( i_rKey, i_Fallback );
    return i_Fallback;
  }

  // The owner's write.
  template<class T>
  bool Publish( const std::string& i_rKey, const T& i_rValue ) const
  {
    return PublishVariant( i_rKey, KVZ::Variant::Make( i_rValue ) );
  }
  bool PublishVariant( const std::string& i_rKey, const KVZ::Variant& i_rValue ) const;

  // Replaces the choices of a parameter. False, with nothing changed, for an empty list or one with the same label twice.
  bool OfferChoices( const std::string& i_rKey, const VParameterChoices& i_rChoices ) const;
  // If the parameter's value is none of the new choices, the fallback becomes the value too, by the owner's write; an empty one stands for the
  // first choice. That holds for choices with the same label twice as well, although they are not shown. False for an empty list alone.
  bool OfferChoicesAndCorrect( const std::string& i_rKey, const VParameterChoices& i_rChoices, const KVZ::Variant& i_rFallback = {} ) const;

  // Runs a reaction later on the postal service, if the handler still lives then.
  template<class THandler, class TReaction>
  void PostLater( THandler& i_rHandler, TReaction i_Reaction ) const
  {
    const auto Run = [pHandler = KVZ::WeakFrom( &i_rHandler ), i_Reaction]
    {
      if( const auto pAlive = pHandler.lock() )
      {
        std::invoke( i_Reaction, *pAlive );
      }
    };
    m_pPostalService->Post( Run );
  }

  const std::shared_ptr<KVZ::IPostalService>& PostalService() const { return m_pPostalService; }
  IDataStore& DataStore() const { return *m_pDataStore; }

private:
  VParameter& AddParameterOf( std::shared_ptr<const VParameterChecker> i_pChecker, const VDataPath& i_rPath, const VParameterText& i_rText,
    uint32_t i_Traits );

  const std::shared_ptr<KVZ::IPostalService> m_pPostalService;
  const std::shared_ptr<IDataStore> m_pDataStore;
  const std::shared_ptr<StageCorePluginInterface::IParameterRegistry> m_pParameterRegistry;
  const std::shared_ptr<VParameterGroup> m_pParameterGroup;
};
