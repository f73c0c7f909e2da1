#pragma once

#include <ZEK/Store.h>
#include <ZEK/StoreFlags.h>

#include <array>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace Store
{

/// A field of an entry as texts: nothing when it is empty, else its text, the type and bytes of its value, or one for
/// each element of a list.
using VModelField = std::vector< std::string >;
VModelField FieldOf( const ZEK::VTypedValue& i_rValue );
/// The field that the reader shows for a change bit.
VModelField FieldOf( const ZEK::IStoreReader& i_rReader, ZEK::IStoreReader::Entry i_pEntry, unsigned i_Bit );

/// The bits of the change word that stand for a field other than a flag.
inline constexpr std::array< unsigned, 16 > FieldBits{ 16, 17, 18, 24, 25, 26, 27, 28, 29, 32, 33, 34, 35, 36, 37, 38 };

/// What a store must show and tell, in the plainest form: a map of paths, without sharing, order or memory of its own.
class VStoreModel
{
public:
  using VFields = std::map< unsigned, VModelField >;
  struct VRecord
  {
    std::uint64_t m_Mask = 0;
    const ZEK::IO::ISchema* m_pSchema = nullptr;
    std::uint32_t m_Flags = 0;
    VFields m_Fields;
  };
  struct VNode
  {
    bool m_bOld = false;
    const ZEK::IO::ISchema* m_pSchema = nullptr;
    std::uint32_t m_Flags = 0;
    VFields m_Fields;
    std::array< std::uint64_t, 5 > m_Stamps{};
    std::optional< VRecord > m_Record;
    std::uint64_t m_Told = 0; ///< the flags of the last commit
  };

  explicit VStoreModel( const std::vector< std::string >& i_rPaths );
  static std::string ParentOf( const std::string& i_rPath );
  static std::string LeafOf( const std::string& i_rPath );

  std::map< std::string, VNode >& Nodes() { return m_Nodes; }
  bool Exists( const std::string& i_rPath ) const;
  std::vector< std::string > Children( const std::string& i_rPath ) const;
  std::uint32_t Flags( const std::string& i_rPath ) const;
  VModelField Read( const std::string& i_rPath, unsigned i_Bit ) const;
  const ZEK::IO::ISchema* Schema( const std::string& i_rPath ) const;

  /// A typed field, or with bit 0 the value that `SetValue` chooses. The code of the result.
  ZEK::IResult SetTyped( const std::string& i_rPath, unsigned i_Bit, const ZEK::VTypedValue& i_rValue );
  ZEK::IResult SetDefault( const std::string& i_rPath, const ZEK::VTypedValue& i_rValue );
  ZEK::IResult AddChoice( const std::string& i_rPath, const ZEK::VTypedValue& i_rValue, const std::string& i_rText,
                          const std::string& i_rToolTip );
  ZEK::IResult RemoveChoice( const std::string& i_rPath, std::size_t i_Index );
  ZEK::IResult ClearChoices( const std::string& i_rPath );
  ZEK::IResult SetToolTip( const std::string& i_rPath, std::size_t i_Index, const std::string& i_rText );
  ZEK::IResult SetSchema( const std::string& i_rPath, const ZEK::IO::ISchema* i_pSchema );
  ZEK::IResult Remove( const std::string& i_rPath );
  void SetFlags( const std::string& i_rPath, std::uint32_t i_Flags, bool i_bOn );
  void SetPlain( const std::string& i_rPath, unsigned i_Bit, VModelField i_Field );
  void Touch( const std::string& i_rPath );

  /// Merges; the told flags of every entry are then those of this commit.
  void Commit( std::uint64_t i_Id );
  std::size_t RecordCount() const;
  bool IsVerificationPending( const VNode& i_rNode ) const;

private:
  VRecord& Acquire( const std::string& i_rPath );
  VRecord& Obtain( const std::string& i_rPath );
  VRecord* ObtainFor( const std::string& i_rPath, const ZEK::VTypedValue& i_rValue );
  void Swap( const std::string& i_rPath );
  void EmptyForReadout( const std::string& i_rPath, VRecord& io_rRecord );
  void FillChoices( VNode& io_rNode );
  void Merge( const std::string& i_rPath, VNode& io_rNode, std::uint64_t i_Id );
  void Apply( VNode& io_rNode, const VRecord& i_rRecord, std::uint64_t i_Mask, std::uint64_t& io_rTold,
              std::uint64_t i_Id );

  std::map< std::string, VNode > m_Nodes;
  std::map< std::string, std::vector< std::string > > m_Children; ///< all that may ever be there, in order
};

} // namespace Store
