#pragma once

#include <Flow2Graphics/ISubjectSelectionMaker.h>

#include <utility>
#include <vector>

namespace Flow2Graphics
{

/// Finds the records of a group by the id of their object.
class VSubjectDirectory
{
public:
  void Build( const MoxelGraphics::VSubjectGroup& i_rGroup );
  /// The first record with that id, in the order of the group; false when there is none.
  bool Find( std::uint64_t i_Id, std::uint32_t& o_rRecord ) const;

private:
  std::vector< std::pair< std::uint64_t, std::uint32_t > > m_Entries; ///< ascending
};

/// One kind of part of a group's objects, as members of one range of selection ids: looks up what an index stands for
/// by arithmetic on the group's ranges.
class VSubjectMembers final : public MoxelGraphics::IRangeResolver
{
public:
  enum EPart
  {
    ERecords, ///< the objects themselves
    EMarkers,
    ESticks, ///< stand for their objects
    EBones
  };

  VSubjectMembers( EPart i_Part, const MoxelGraphics::VSubjectGroup& i_rGroup, const ISubjectSelectionMaker& i_rMaker,
                   const VSubjectDirectory& i_rDirectory );

  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override;
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override;
  bool GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const override;
  bool GetPose( std::uint32_t i_Index, MoxelGraphics::VScenePose& o_rPose ) const override;

  /// All members that an item stands for; empty when none does.
  MoxelGraphics::VSubjectRange FindAll( const ZEK::VSelectionItem& i_rItem ) const;
  std::uint32_t Count() const;

private:
  MoxelGraphics::VSubjectRange RangeOf( const MoxelGraphics::VSubjectRecord& i_rRecord ) const;
  const MoxelGraphics::VSubjectRecord* RecordOf( std::uint32_t i_Index ) const;

  EPart m_Part;
  const MoxelGraphics::VSubjectGroup& m_rGroup;
  const ISubjectSelectionMaker& m_rMaker;
  const VSubjectDirectory& m_rDirectory;
};

} // namespace Flow2Graphics
