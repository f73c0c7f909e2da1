#pragma once

#include <ZEK/Store.h>

#include <cstdint>
#include <map>
#include <set>
#include <stdexcept>

/// A reader over a map from handles to verified values; all else reads as empty.
class VFakeReader final : public ZEK::IStoreReader
{
public:
  explicit VFakeReader( ZEK::IStore* i_pStore )
    : m_pStore( i_pStore )
  {
  }

  std::map< Entry, ZEK::VTypedValue > m_Values;

  std::shared_ptr< ZEK::IStore > GetSharedStore() const override { return nullptr; }
  ZEK::IStore* GetStore() const override { return m_pStore; }
  std::vector< Entry > FindEntries( const ZEK::VEntryPath& ) const override { return {}; }
  bool HasChildren( Entry ) const override { return false; }
  std::size_t ChildCount( Entry ) const override { return 0; }
  std::vector< Entry > Children( Entry ) const override { return {}; }
  Entry Child( Entry, const std::string& ) const override { return nullptr; }
  bool Exists( Entry i_pEntry ) const override { return m_Values.count( i_pEntry ) != 0; }
  bool HasValue( Entry i_pEntry ) const override { return !VerifiedValue( i_pEntry ).IsEmpty(); }
  const ZEK::IO::ISchema* Schema( Entry i_pEntry ) const override { return VerifiedValue( i_pEntry ).Schema(); }
  const ZEK::VTypedValue& VerifiedValue( Entry i_pEntry ) const override
  {
    const auto Found = m_Values.find( i_pEntry );
    return Found != m_Values.end() ? Found->second : m_None;
  }
  const ZEK::VTypedValue& ProposedValue( Entry ) const override { return m_None; }
  const ZEK::VTypedValue& DefaultValue( Entry ) const override { return m_None; }
  std::uint32_t Flags( Entry ) const override { return 0; }
  bool IsVerificationPending( Entry ) const override { return false; }
  bool HasPresentation( Entry ) const override { return false; }
  const ZEK::VTypedValue& Minimum( Entry ) const override { return m_None; }
  const ZEK::VTypedValue& Maximum( Entry ) const override { return m_None; }
  std::size_t ChoiceCount( Entry ) const override { return 0; }
  const std::vector< ZEK::VTypedValue >& Choices( Entry ) const override { return m_Choices; }
  const std::vector< std::string >& ChoiceTexts( Entry ) const override { return m_Texts; }
  const std::vector< std::string >& ChoiceToolTips( Entry ) const override { return m_Texts; }
  const std::string& PresentationText( Entry ) const override { return m_Text; }
  bool HasExtras( Entry ) const override { return false; }
  const std::optional< std::string >& OptionalText( Entry ) const override { return m_Optional; }
  const std::string& ExtraText1( Entry ) const override { return m_Text; }
  const std::string& ExtraText2( Entry ) const override { return m_Text; }
  const std::string& ExtraText3( Entry ) const override { return m_Text; }
  std::uint32_t ExtraNumber1( Entry ) const override { return 0; }
  std::uint32_t ExtraNumber2( Entry ) const override { return 0; }
  const std::string& Attributes( Entry ) const override { return m_Text; }
  std::uint32_t Capabilities( Entry ) const override { return 0; }
  ZEK::ChangeId Generation() const override { return {}; }
  ZEK::VChangeIds ChangeIds( Entry ) const override { return {}; }
  void Defer( std::function< void() > ) const override {}

private:
  ZEK::IStore* m_pStore;
  ZEK::VTypedValue m_None;
  std::vector< ZEK::VTypedValue > m_Choices;
  std::vector< std::string > m_Texts;
  std::optional< std::string > m_Optional;
  std::string m_Text;
};

/// Counts scopes, and ends them as told. Its handles are addresses of paths.
class VFakeStore final : public ZEK::IStore
{
public:
  VFakeReader m_Reader{ this };
  int m_Reads = 0;  ///< open read scopes
  int m_Writes = 0; ///< ended write scopes
  const char* m_pThrown = nullptr;

  const ZEK::VEntryPath& GetEntryPath( const ZEK::VEntryPath& i_rPath ) override
  {
    return *m_Paths.insert( i_rPath ).first;
  }
  ZEK::IResult Shutdown() override { return ZEK::IResult::Ok; }
  Store::VStoreEntry* GetRootEntry() override { return GetEntry( "" ); }
  Store::VStoreEntry* GetEntry( const ZEK::VEntryPath& i_rPath ) override { return Handle( GetEntryPath( i_rPath ) ); }
  const ZEK::VEntryPath& EntryPath( const Store::VStoreEntry* i_pEntry ) const override
  {
    return *reinterpret_cast< const ZEK::VEntryPath* >( i_pEntry );
  }
  ZEK::IStoreReader* BeginRead() override
  {
    ++m_Reads;
    return &m_Reader;
  }
  void EndRead() override
  {
    --m_Reads;
    Throw();
  }
  ZEK::IStoreWriter* BeginWrite() override { return m_Reads == 0 ? m_pWriter : nullptr; }
  void EndWrite() override
  {
    ++m_Writes;
    Throw();
  }
  std::shared_ptr< ZEK::IHandlerCallback > RegisterHandler( const ZEK::VEntryPatternSet& ) override { return nullptr; }
  std::size_t HandlerCount() const override { return 0; }
  Store::VStoreEntry* FindEntry( const ZEK::VEntryPath& i_rPath ) const override
  {
    const auto Found = m_Paths.find( i_rPath );
    return Found != m_Paths.end() ? Handle( *Found ) : nullptr;
  }

private:
  static Store::VStoreEntry* Handle( const ZEK::VEntryPath& i_rPath )
  {
    return reinterpret_cast< Store::VStoreEntry* >( const_cast< ZEK::VEntryPath* >( &i_rPath ) );
  }
  void Throw() const
  {
    if ( m_pThrown != nullptr )
    {
      throw std::runtime_error( m_pThrown );
    }
  }

  /// Never followed: the tests look at the scope alone.
  ZEK::IStoreWriter* m_pWriter = reinterpret_cast< ZEK::IStoreWriter* >( &m_Reader );
  std::set< ZEK::VEntryPath > m_Paths;
};
