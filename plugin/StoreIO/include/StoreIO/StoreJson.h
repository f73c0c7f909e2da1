#pragma once

#include <ZEK/Result.h>
#include <ZEK/StoreReader.h>
#include <ZEK/StoreWriter.h>

#include <rapidjson/fwd.h>

#include <cstddef>
#include <iosfwd>
#include <memory>
#include <string>
#include <string_view>

namespace StoreIO
{

/// The greatest number of components of a path in a document. Documents and stores beyond it are refused on both ways.
inline constexpr std::size_t MaximumComponents = 512;

class IStoreImporter
{
public:
  virtual ~IStoreImporter() = default;
  /// Writes what was read to the writer's store, within the writer's scope.
  virtual ZEK::IResult Import( ZEK::IStoreWriter& io_rWriter ) = 0;
};

class IStoreExporter
{
public:
  virtual ~IStoreExporter() = default;
  /// Takes what the reader sees. Nothing of the exporter changes after a failure.
  virtual ZEK::IResult Export( ZEK::IStoreReader& i_rReader ) = 0;
};

/// Reads settings from a JSON document of the versions 3.0 to 3.0.
///
/// The `Read` functions take a document in and replace the one before, `Import` may then be called any number of
/// times. Text that is not one JSON document, or whose brackets are nested deeper than any document of settings, is
/// `InvalidFormat`, and leaves the importer without a document; a UTF-8 mark at the beginning is passed over. The
/// stack in use does not depend on the document. Thread: one at a time.
class VStoreImporterJson final : public IStoreImporter
{
public:
  VStoreImporterJson();
  ~VStoreImporterJson() override;
  VStoreImporterJson( VStoreImporterJson&& ) noexcept;
  VStoreImporterJson& operator=( VStoreImporterJson&& ) noexcept;

  /// A file that was written by `WriteFile`: what a save that was broken off left is put right first.
  ZEK::IResult ReadFile( const std::string& i_rPath );
  /// The file as it is, with nothing done to what lies beside it.
  ZEK::IResult ReadPlainFile( const std::string& i_rPath );
  /// All that is left of the stream. `FileIOFailure` when the stream goes bad.
  ZEK::IResult ReadStream( std::istream& io_rStream );
  ZEK::IResult ReadText( std::string_view i_Text );
  /// Where and why the last text was refused, "Missing a comma or } after an object member. at line 3, column 7";
  /// empty after a success.
  const std::string& ReadError() const;

  /// `InvalidFormat` without a document whose root is an object, `FileNotOpen` for an empty object,
  /// `InvalidVersion` for another version; nothing is written then. Faults inside are logged one by one, what is
  /// good is written all the same, and the result is `Failed`, or `InvalidFormat` when something is nested too
  /// deep. `OkButPartial` when entries of the store have other types and were left alone.
  ///
  /// Whole numbers are cut to the width of their type, and a number that a Float32 cannot hold becomes its greatest.
  ZEK::IResult Import( ZEK::IStoreWriter& io_rWriter ) override;

private:
  struct VState;
  std::unique_ptr< VState > m_pState;
};

/// Writes settings to a JSON document of the version 3.0.
///
/// Names in the document are those of the store, which is kept alive by the exporter for that. `Write` functions may
/// be called outside any scope. Thread: one at a time.
class VStoreExporterJson final : public IStoreExporter
{
public:
  VStoreExporterJson();
  ~VStoreExporterJson() override;
  VStoreExporterJson( VStoreExporterJson&& ) noexcept;
  VStoreExporterJson& operator=( VStoreExporterJson&& ) noexcept;

  /// Sets the members "Version" and "Children" of the document, which must be an object or null, else
  /// `InvalidArgument`; other members stay. Entries that cannot be written are logged one by one, and the result is
  /// `Failed`.
  ZEK::IResult Export( ZEK::IStoreReader& i_rReader ) override;
  /// The document, under the same conditions, becomes an object with the children of the entry as its members, and
  /// nothing else: no top level.
  ZEK::IResult ExportSubTree( ZEK::IStoreReader& i_rReader, ::Store::VStoreEntry* i_pEntry );
  /// As `Export`, of the entry and all below it alone, at its own path. `NotFound` when it is not there.
  ZEK::IResult ExportBranch( ZEK::IStoreReader& i_rReader, ::Store::VStoreEntry* i_pEntry );

  /// Include <rapidjson/document.h> to use it. Strings in it live as long as the exporter, or until the next export.
  rapidjson::Document& Document();

  /// `SerialisationFailure` for a number that is not finite, and `FileIOFailure` for a stream that goes bad, with a
  /// line in the log; part of the text is in the stream then.
  ZEK::IResult WriteStream( std::ostream& io_rStream ) const;
  /// As `WriteStream`; appends.
  ZEK::IResult WriteText( std::string& io_rText ) const;
  /// Puts the document under that name so that at any moment the old or the new file is there, whole.
  /// `AlreadyPresent`, without a line in the log, when there is a file and it must not be replaced.
  ZEK::IResult WriteFile( const std::string& i_rPath, bool i_bOverwrite ) const;
  /// Writes over the file in place: what a protected save wants to be called with.
  ZEK::IResult WritePlainFile( const std::string& i_rPath ) const;

private:
  struct VState;
  std::unique_ptr< VState > m_pState;
};

} // namespace StoreIO
