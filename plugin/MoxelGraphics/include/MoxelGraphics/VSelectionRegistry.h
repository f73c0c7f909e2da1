#pragma once

#include <ZEK/Selection.h>

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace MoxelGraphics
{

/// The parts of a selection word: what an object writes instead of its colour so that pixels tell what they show.
enum ESelectionWord : std::uint32_t
{
  EIdMask = 0x1FFFFF, ///< the id; 0 means nothing
  EIdSelected = 0x200000,
  EIdPreselected = 0x400000,
  EIdPrimary = 0x800000, ///< the current item
  EIdPixelMask = 0xFFFFFF
};

/// A sphere in the world, mm.
struct VScenePoint
{
  float X = 0, Y = 0, Z = 0, Radius = 0;
};

/// Where an object stands; `Index` is its user's own.
struct VScenePose
{
  std::array< float, 16 > Matrix{ 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1 }; ///< column-major, world from object
  std::int32_t Index = 0;
};

/// Knows the members of a range of ids. Asked only when a pick is resolved or a view looks at the selection, never
/// while a frame is drawn. Owned by whoever took the range; lives until the registry's next `Reset`.
class IRangeResolver
{
public:
  virtual ~IRangeResolver() = default;
  /// False when the index stands for nothing. An empty label is none.
  virtual bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const = 0;
  /// The reverse: the index of an item, false when it is none of the range.
  virtual bool FindIndex( const ZEK::VSelectionItem& /*i_rItem*/, std::uint32_t& /*o_rIndex*/ ) const { return false; }
  virtual bool GetPoint( std::uint32_t /*i_Index*/, VScenePoint& /*o_rPoint*/ ) const { return false; }
  virtual bool GetPose( std::uint32_t /*i_Index*/, VScenePose& /*o_rPose*/ ) const { return false; }
};

/// Hands out the selection ids of one frame of state, and turns ids back into items.
///
/// Ids are taken in ranges into flat storage that keeps its capacity: taking one allocates nothing in the steady
/// state. An id is meaningless after the next `Reset`. Thread: render thread.
///
/// Ids are given in the order of asking. From 0x40000 on an id's own bits make an object that is both selected and
/// preselected look like the current item in the outline: what comes in great numbers, mask cells and grey blobs,
/// asks last, so that only those ever get there.
class VSelectionRegistry
{
public:
  struct VMark
  {
    ZEK::VSelectionItem Item;
    std::uint32_t Flags = 0; ///< EIdSelected, EIdPreselected, EIdPrimary
  };

  /// A null service means that nothing is ever selected.
  explicit VSelectionRegistry( std::shared_ptr< ZEK::ISelectionService > i_pService );

  /// Forgets everything, begins again at id 1 and takes fresh copies of selection and preselection.
  void Reset();

  /// The first id of `i_Count` ids that stand for the item or, for the kinds that have a sub-index, for the members
  /// of the object it names. 0 when the ids have run out: the object is then drawn and cannot be picked.
  std::uint32_t Allocate( const ZEK::VSelectionItem& i_rItem, std::uint32_t i_Count = 1 );
  std::uint32_t AllocateLabelled( const ZEK::VSelectionItem& i_rItem, std::uint32_t i_Count,
                                  const std::string& i_rLabel );
  /// The first of `i_Count` ids whose items and labels the resolver knows; 0 when the ids have run out.
  std::uint32_t AllocateRange( std::uint32_t i_Count, const IRangeResolver& i_rResolver );

  /// Takes one id for the item and gives its word with the item's flags.
  std::uint32_t Word( const ZEK::VSelectionItem& i_rItem );
  std::uint32_t Word( const ZEK::VSelectionItem& i_rItem, const std::string& i_rLabel, bool i_bPrimary );
  /// The same as the three colour parts that a program writes.
  std::array< float, 3 > Colour( const ZEK::VSelectionItem& i_rItem );
  std::array< float, 3 > Colour( const ZEK::VSelectionItem& i_rItem, const std::string& i_rLabel, bool i_bPrimary );
  static std::array< float, 3 > ColourOfWord( std::uint32_t i_Word );

  /// EIdSelected, EIdPreselected and EIdPrimary as they hold for the item.
  std::uint32_t Flags( const ZEK::VSelectionItem& i_rItem ) const;
  /// All items that have a flag, in the order of items. Whoever owns many objects walks these few instead of asking
  /// for each object.
  std::span< const VMark > Marks() const { return m_Marks; }
  /// Grows when a `Reset` found other marks than the one before.
  std::uint64_t MarksGeneration() const { return m_MarksGeneration; }

  void SetPosition( const ZEK::VSelectionItem& i_rItem, const VScenePoint& i_rPoint );
  void SetPose( const ZEK::VSelectionItem& i_rItem, const VScenePose& i_rPose );
  /// Looks at what was set, then asks the resolvers.
  bool GetPosition( const ZEK::VSelectionItem& i_rItem, VScenePoint& o_rPoint ) const;
  bool GetPose( const ZEK::VSelectionItem& i_rItem, VScenePose& o_rPose ) const;

  /// False for 0 and for ids that were not handed out since `Reset`. Bits above the id are ignored.
  bool Resolve( std::uint32_t i_Id, ZEK::VSelectionItem& o_rItem ) const;
  bool Resolve( std::uint32_t i_Id, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const;
  /// The items of those ids, none twice, in the order of the ids; appends each label there is.
  ZEK::VSelection ResolveAll( std::span< const std::uint32_t > i_Ids, std::vector< std::string >& io_rLabels ) const;
  /// The id of an item, 0 when it has none.
  std::uint32_t FindId( const ZEK::VSelectionItem& i_rItem ) const;

  std::uint32_t NextId() const { return m_NextId; }

private:
  struct VRange
  {
    std::uint32_t First = 0;
    std::uint32_t Count = 0;
    std::uint32_t ItemIndex = 0; ///< into m_Items when there is no resolver
    const IRangeResolver* pResolver = nullptr;
  };
  struct VLabel
  {
    std::uint32_t Id = 0;
    std::string Text;
  };
  /// Records by item, found through an index that is sorted when somebody asks.
  template < typename TValue >
  struct VTable
  {
    struct VEntry
    {
      ZEK::VSelectionItem Item;
      TValue Value;
    };
    void Clear();
    void Set( const ZEK::VSelectionItem& i_rItem, const TValue& i_rValue );
    bool Get( const ZEK::VSelectionItem& i_rItem, TValue& o_rValue ) const;

    std::vector< VEntry > Entries;
    std::size_t Count = 0;
    mutable std::vector< std::uint32_t > Order;
    mutable bool bSorted = true;
  };

  bool Take( std::uint32_t i_Count, VRange*& o_rpRange );
  void WarnOfLookalikes( const VRange& i_rRange );
  /// The first answer of a resolver that knows the item.
  template < typename TAsk >
  bool AskResolvers( const ZEK::VSelectionItem& i_rItem, TAsk i_Ask ) const;
  bool FindIn( const VRange& i_rRange, const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const;
  void TakeMarks();
  const VRange* RangeOf( std::uint32_t i_Id ) const;

  std::shared_ptr< ZEK::ISelectionService > m_pService;
  std::uint32_t m_NextId = 1;
  std::vector< VRange > m_Ranges;
  std::vector< ZEK::VSelectionItem > m_Items; ///< only the first m_ItemCount hold something
  std::size_t m_ItemCount = 0;
  std::vector< VLabel > m_Labels;
  std::size_t m_LabelCount = 0;
  VTable< VScenePoint > m_Positions;
  VTable< VScenePose > m_Poses;
  std::vector< VMark > m_Marks;
  std::uint64_t m_MarksGeneration = 1;
  std::uint64_t m_ServiceGeneration = 0;
  bool m_bMarksTaken = false;
  bool m_bRanOut = false;
  bool m_bWarned = false;
};

} // namespace MoxelGraphics
