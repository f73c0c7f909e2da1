#pragma once

#include <Flow2TypesUtils/TaggedItemCache.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <ZEK/DebugServices.h>
#include <ZEK/FlowState.h>

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace Flow2TypesUtils
{

/// Joins the items of a state by object name: for each object one value of each tag, aligned by index, the objects in
/// the order of their names' bytes, and a cheap answer to what changed since the update before.
///
/// Equal value ids are equal values, names and all. So an update that finds in every tag the ids of the update before
/// keeps the join and costs an id comparison an item; one that finds new values of the same objects in the same order
/// costs a name comparison for each new value; only else the names are sorted again. No update allocates once the
/// vectors have their size. Thread: one consumer, inside its update.
///
/// Whatever is asked for is asked while the state of the last update lives, and good for as long; `Items` gives
/// references to keep.
class VTaggedCoreTypeExtractor
{
public:
  using VItemCache = Flow2TypesUtils::VItemCache;
  /// The slot of a name that is not there.
  static constexpr std::uint64_t NoIndex = ~std::uint64_t{ 0 };

  VTaggedCoreTypeExtractor();
  ~VTaggedCoreTypeExtractor();
  VTaggedCoreTypeExtractor( const VTaggedCoreTypeExtractor& ) = delete;
  VTaggedCoreTypeExtractor& operator=( const VTaggedCoreTypeExtractor& ) = delete;

  /// Called from the consumer's constructor, once for each tag; `TFlow` is the kind of item, e.g. `FlowDevice`.
  template < typename TFlow >
  void AddCache( ETagRequirement i_Requirement )
  {
    using TCoreType = typename ZEK::FlowValueType< TFlow >::type;
    Insert( ZEK::FlowTag< TFlow >,
            std::make_unique< VItemCacheTyped< TCoreType > >( ZEK::FlowTag< TFlow >, i_Requirement ) );
  }

  /// Joins anew. `i_NameSelector` picks the name that joins: 2 for cameras and devices, 3 for subjects. True when there
  /// is an object.
  bool Update( const ZEK::IFlowState& i_rState, std::uint32_t i_NameSelector, ZEK::EFlowTimeMatch i_Match,
               const ZEK::VFlowTimeKey& i_rKey );

  const std::vector< std::string >& Names() const { return m_Names; }
  /// Whether the names differ from those of the update before, in number or in any.
  bool NamesChanged() const { return m_bNamesChanged; }
  /// The slot of a name; false, with `NoIndex`, when it is not there.
  bool IndexOf( std::string_view i_Name, std::uint64_t& o_rIndex ) const;

  /// The payloads of a kind by slot, null where an object has none. Empty when a tag that is `RequiredIfAny` did not
  /// occur.
  template < typename TFlow >
  const std::vector< const typename ZEK::FlowValueType< TFlow >::type* >& Values() const
  {
    using TCoreType = typename ZEK::FlowValueType< TFlow >::type;
    const auto* pCache = Typed< TCoreType >(
        ZEK::FlowTag< TFlow >,
        "dynamic_cast< const VItemCacheTyped< typename ZEK::FlowValueType< T >::type >* >( It->second.get() )" );
    static const std::vector< const TCoreType* > None;
    return pCache ? pCache->Values() : None;
  }
  template < typename TFlow >
  void Values( std::vector< const typename ZEK::FlowValueType< TFlow >::type* >& o_rValues ) const
  {
    o_rValues = Values< TFlow >();
  }
  /// The same by core type and tag, for consumers whose tags are not known when they are compiled.
  template < typename TCoreType >
  void Values( std::uint32_t i_Tag, std::vector< const TCoreType* >& o_rValues ) const
  {
    const auto* pCache =
        Typed< TCoreType >( i_Tag, "dynamic_cast< const VItemCacheTyped< TCoreType >* >( It->second.get() )" );
    o_rValues.clear();
    if ( pCache )
    {
      o_rValues = pCache->Values();
    }
  }
  /// The items of a kind by slot, each with a reference, null where an object has none.
  template < typename TFlow >
  void Items( std::vector< ZEK::VFlowItemRef >& o_rItems ) const
  {
    Items( ZEK::FlowTag< TFlow >, o_rItems );
  }
  void Items( std::uint32_t i_Tag, std::vector< ZEK::VFlowItemRef >& o_rItems ) const;

  /// The entries of a tag by slot; the state's end cursor where an object has none.
  const std::vector< ZEK::VFlowCursor >& Entries( std::uint32_t i_Tag ) const;
  bool Changed( std::uint32_t i_Tag ) const;
  /// Whether the names or anything of any tag changed.
  bool Changed() const;
  /// Whether the state has an item of the tag, be it of an object or not.
  bool Occurs( std::uint32_t i_Tag ) const;
  /// See `VItemCache::ChangedBits`.
  void ChangedBits( std::uint32_t i_Tag, std::vector< bool >& o_rBits ) const;

private:
  void Insert( std::uint32_t i_Tag, std::unique_ptr< VItemCache > i_pCache );
  /// Null after an assertion that returned: the tag was never added.
  const VItemCache* Find( std::uint32_t i_Tag ) const;
  template < typename TCoreType >
  const VItemCacheTyped< TCoreType >* Typed( std::uint32_t i_Tag, const char* i_pExpression ) const
  {
    const VItemCache* pCache = Find( i_Tag );
    // What the cast of the expression would say, at a tenth of its cost.
    const bool bTyped = pCache && pCache->ValueType() == typeid( TCoreType );
    if ( pCache )
    {
      DebugServices::Check( bTyped, i_pExpression, __FILE__, __LINE__ );
    }
    return bTyped ? static_cast< const VItemCacheTyped< TCoreType >* >( pCache ) : nullptr;
  }

  bool KeepJoin( const VJoinQuery& i_rQuery );
  bool JoinAnew( const VJoinQuery& i_rQuery );
  void Abort();

  std::vector< std::pair< std::uint32_t, std::unique_ptr< VItemCache > > > m_ItemCacheMap; ///< ascending by tag
  std::unique_ptr< VNameTable > m_pTable;
  std::vector< std::string > m_Names;
  std::vector< std::string > m_PreviousNames; ///< as of the last join that was made anew
  bool m_bNamesChanged = false;
  bool m_bJoined = false; ///< the caches hold the join of the update before
  std::uint32_t m_NameSelector = 0;
  ZEK::VFlowCursor m_EndEntry;
};

} // namespace Flow2TypesUtils
