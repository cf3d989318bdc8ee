#pragma once

#include "platform/base/num_range.h"
#include "platform/store/configb.h"

#include <concepts>
#include <cstdint>
#include <string_view>

/// The keys of an edit's header: one table of what each holds, and a typed name for each row. Keys that only
/// one form of another tool's timelines knows are that form's.
///
/// The names and types live in files: do not change them. A row that is no longer written stays, so that its
/// name is not used for something else.
namespace EditKeys {

enum class Type : uint8_t { Bool, Int, Int64, Double, Text, Cookie };

/// Whether a key says something of the edit's content.
enum class Role : uint8_t {
    Content,
    Bookkeeping ///< of its saves and states, or of what is compared elsewhere; two equal edits may differ in
                ///< it
};

/// Whether a number, from 0, stands behind the name.
enum class Form : uint8_t { Plain, Numbered };

struct Row {
    std::string_view name;
    Type type = Type::Int;
    double fallback = 0; ///< of a number, where the key is missing; a text's is empty, a cookie's invalid
    Role role = Role::Content;
    Form form = Form::Plain;
};

inline constexpr Row kTable[] = {
    // What the edit is
    {"NAME", Type::Text},
    {"READ_ONLY", Type::Bool},
    {"IS_BACKUP", Type::Int, 0, Role::Bookkeeping},
    {"ORIGINAL_MATERIAL", Type::Int},
    {"HIDDEN", Type::Int},
    {"SEARCH_EDIT", Type::Int},
    {"ENTIRE_MEDIUM", Type::Int},
    {"PERMISSIONS", Type::Int, 2},
    {"OWNER", Type::Text},
    {"PROJECT_COOKIE", Type::Cookie},
    {"UNDO_COOKIE", Type::Cookie, 0, Role::Bookkeeping},
    {"REDO_COOKIE", Type::Cookie, 0, Role::Bookkeeping},
    {"FX_TEMPLATE", Type::Text},
    {"KEMROLL_TIME", Type::Double},
    {"hidden_cookie", Type::Cookie},
    {"is_dupe", Type::Int, -1},
    {"is_slash_dupe", Type::Int, -1},
    // When and by what it was made and changed
    {"CREATION_TIME", Type::Int},
    {"CREATION_PROGRAM", Type::Text},
    {"MODIFICATION_TIME", Type::Int, 0, Role::Bookkeeping},
    {"MOD_TIME_V3", Type::Int, 0, Role::Bookkeeping},
    {"MODIFICATION_PROGRAM", Type::Text, 0, Role::Bookkeeping},
    {"MOD_COUNT", Type::Int64, 0, Role::Bookkeeping},
    {"CHANGE_DESCRIPTION", Type::Text, 0, Role::Bookkeeping},
    {"OWN_CHANGE", Type::Text, 0, Role::Bookkeeping},
    {"MILESTONE", Type::Int64, 0, Role::Bookkeeping},
    {"CLIPBOARD_USED", Type::Int, 0, Role::Bookkeeping},
    // What it is counted and played by
    {"ED2_REVISION", Type::Int, 1},
    {"FRAME_RATE", Type::Int},
    {"FRAME_BASED", Type::Int},
    {"TRANSFER", Type::Int, 3},
    {"TRANSFER_AUDIO_MEDIUM", Type::Int},
    {"SEQUENCE", Type::Int},
    {"SOURCE_MEDIUM", Type::Int},
    {"SOURCE_MEDIUM_DURATION", Type::Double, Qx::kNoTime},
    {"ELAPSED_ORIGIN", Type::Double},
    {"EDIT_START", Type::Int64},
    {"DROP_FRAME", Type::Bool},
    {"CURRENT_TIME", Type::Double},
    {"MARK_TIME", Type::Double, Qx::kNoTime},
    // Of its channels, by their numbers
    {"NUM_CHANS", Type::Int, 0, Role::Bookkeeping},
    {"CelKind", Type::Text, 0, Role::Bookkeeping, Form::Numbered},
    {"Levels", Type::Text, 0, Role::Bookkeeping, Form::Numbered},
    {"LevelsName", Type::Text, 0, Role::Bookkeeping, Form::Numbered},
    {"LevelsPlace", Type::Int, 0, Role::Bookkeeping, Form::Numbered},
    {"LevelsUnread", Type::Text, 0, Role::Content, Form::Numbered},
    {"SyncLoss", Type::Double, 0, Role::Bookkeeping, Form::Numbered},
    {"SYNC_ERROR", Type::Double, 0, Role::Bookkeeping, Form::Numbered},
    {"SOUND_OUTPUT_FLAG", Type::Int, 1, Role::Bookkeeping, Form::Numbered},
    {"SOUND_OUTPUT_XFADE", Type::Int, 0, Role::Bookkeeping, Form::Numbered},
    // Of older revisions
    {"CHAN_GRPS", Type::Text},
    {"tvtype", Type::Text},
    {"quality", Type::Int},
    {"quality_string", Type::Text},
    {"TRANSFER_FILM_SPEED", Type::Double, 24},
    {"FILM_SYNC_FACTOR", Type::Double, 1},
    // Labels, rolls and where it comes from
    {"numLabels_", Type::Int},
    {"LABEL", Type::Text, 0, Role::Content, Form::Numbered},
    {"LabelUnread", Type::Text, 0, Role::Content, Form::Numbered},
    {"NUM_MEDIUMROLLS", Type::Int},
    {"MEDIUMROLL", Type::Text, 0, Role::Content, Form::Numbered},
    {"RollUnread", Type::Text, 0, Role::Content, Form::Numbered},
    {"reelid", Type::Text},
    {"SHOT_VIDEO", Type::Text},
    {"TrackOrigin ", Type::Text},
};

/// The name of a row, with the type that its value is read and written as. One whose name or type is that of
/// no row does not compile.
template <typename T>
class Key {
public:
    consteval explicit Key(std::string_view name) : m_row(rowOf(name)) {}

    [[nodiscard]] constexpr std::string_view name() const { return m_row.name; }
    constexpr operator std::string_view() const { return m_row.name; }

    /// The value of a number whose key is missing.
    [[nodiscard]] constexpr T fallback() const requires std::is_arithmetic_v<T> {
        return static_cast<T>(m_row.fallback);
    }
    /// The value; the table's where the key is missing or of another type.
    [[nodiscard]] T get(const configb& header) const {
        if constexpr (std::is_arithmetic_v<T>) {
            return get(header, fallback());
        } else if constexpr (std::same_as<T, cookie>) {
            return header.getCookie(m_row.name, invalid_cookie);
        } else {
            return header.getString(m_row.name);
        }
    }
    /// The same with `otherwise` in the place of the table's, for a default that depends on something else.
    [[nodiscard]] T get(const configb& header, T otherwise) const requires std::is_arithmetic_v<T> {
        if constexpr (std::same_as<T, bool>) {
            return header.getBool(m_row.name, otherwise);
        } else if constexpr (std::same_as<T, int>) {
            return header.getInt(m_row.name, otherwise);
        } else if constexpr (std::same_as<T, int64_t>) {
            return header.getInt64(m_row.name, otherwise);
        } else {
            return header.getDouble(m_row.name, otherwise);
        }
    }
    /// False if the store refuses the write.
    bool set(configb& header, const T& value) const { return header.set(m_row.name, configb::Value(value)); }

private:
    static constexpr Type kType = std::same_as<T, bool>      ? Type::Bool
                                  : std::same_as<T, int>     ? Type::Int
                                  : std::same_as<T, int64_t> ? Type::Int64
                                  : std::same_as<T, double>  ? Type::Double
                                  : std::same_as<T, cookie>  ? Type::Cookie
                                                             : Type::Text;

    static consteval const Row& rowOf(std::string_view name) {
        for (const Row& row : kTable) {
            if (row.name == name && row.type == kType) {
                return row;
            }
        }
        throw "no such key of that type";
    }

    const Row& m_row;
};

inline constexpr Key<String> kName{"NAME"};
inline constexpr Key<bool> kReadOnly{"READ_ONLY"};
inline constexpr Key<int> kBackup{"IS_BACKUP"};
inline constexpr Key<int> kOriginalMaterial{"ORIGINAL_MATERIAL"};
inline constexpr Key<int> kHidden{"HIDDEN"};
inline constexpr Key<int> kSearchEdit{"SEARCH_EDIT"};
inline constexpr Key<int> kEntireMedium{"ENTIRE_MEDIUM"};
inline constexpr Key<int> kPermissions{"PERMISSIONS"};
inline constexpr Key<String> kOwner{"OWNER"};
inline constexpr Key<cookie> kProjectCookie{"PROJECT_COOKIE"};
inline constexpr Key<cookie> kUndoCookie{"UNDO_COOKIE"};
inline constexpr Key<cookie> kRedoCookie{"REDO_COOKIE"};
inline constexpr Key<String> kFxTemplate{"FX_TEMPLATE"};
inline constexpr Key<double> kKemrollTime{"KEMROLL_TIME"};
inline constexpr Key<cookie> kHiddenCookie{"hidden_cookie"};
inline constexpr Key<int> kDupe{"is_dupe"};
inline constexpr Key<int> kSlashDupe{"is_slash_dupe"};
inline constexpr Key<int> kCreationTime{"CREATION_TIME"};
inline constexpr Key<String> kCreationProgram{"CREATION_PROGRAM"};
inline constexpr Key<int> kModificationTime{"MODIFICATION_TIME"};
inline constexpr Key<int> kModificationTimeV3{"MOD_TIME_V3"};
inline constexpr Key<String> kModificationProgram{"MODIFICATION_PROGRAM"};
inline constexpr Key<int64_t> kModificationCount{"MOD_COUNT"};
inline constexpr Key<String> kChangeDescription{"CHANGE_DESCRIPTION"};
/// The change that made the state, where an undo or redo led back to it and the description tells of that.
inline constexpr Key<String> kOwnChange{"OWN_CHANGE"};
inline constexpr Key<int64_t> kMilestone{"MILESTONE"};
inline constexpr Key<int> kClipboardUsed{"CLIPBOARD_USED"};
inline constexpr Key<int> kRevision{"ED2_REVISION"};
inline constexpr Key<int> kFrameRate{"FRAME_RATE"};
inline constexpr Key<int> kFrameBased{"FRAME_BASED"};
inline constexpr Key<int> kTransfer{"TRANSFER"};
inline constexpr Key<int> kTransferAudioMedium{"TRANSFER_AUDIO_MEDIUM"};
inline constexpr Key<int> kSequence{"SEQUENCE"};
inline constexpr Key<int> kSourceMedium{"SOURCE_MEDIUM"};
inline constexpr Key<double> kSourceMediumDuration{"SOURCE_MEDIUM_DURATION"};
inline constexpr Key<double> kElapsedOrigin{"ELAPSED_ORIGIN"};
/// The timecode of edit time 0 in frames from midnight, counted in drop frame if `kDropFrame` says so. Of a
/// shot that is the timecode of its source.
inline constexpr Key<int64_t> kStartTimecode{"EDIT_START"};
inline constexpr Key<bool> kDropFrame{"DROP_FRAME"};
inline constexpr Key<double> kCurrentTime{"CURRENT_TIME"};
inline constexpr Key<double> kMarkTime{"MARK_TIME"};
inline constexpr Key<int> kNumChans{"NUM_CHANS"};
inline constexpr Key<String> kCelKind{"CelKind"};           ///< by the number of a cel object
inline constexpr Key<String> kLevels{"Levels"};             ///< by a counter
inline constexpr Key<String> kLevelsName{"LevelsName"};     ///< by the counter of a Levels key
inline constexpr Key<int> kLevelsPlace{"LevelsPlace"};      ///< by the counter of a Levels key
inline constexpr Key<String> kLevelsUnread{"LevelsUnread"}; ///< by a counter
inline constexpr Key<double> kSyncLoss{"SyncLoss"};         ///< by the channel's index
inline constexpr Key<double> kSyncError{"SYNC_ERROR"};      ///< by the channel's old index
inline constexpr Key<int> kSoundOutput{"SOUND_OUTPUT_FLAG"};
inline constexpr Key<int> kSoundOutputXFade{"SOUND_OUTPUT_XFADE"};
inline constexpr Key<String> kLegacyGroups{"CHAN_GRPS"};
inline constexpr Key<String> kTvType{"tvtype"};
inline constexpr Key<int> kQuality{"quality"};
inline constexpr Key<String> kQualityText{"quality_string"};
inline constexpr Key<int> kNumLabels{"numLabels_"};
inline constexpr Key<String> kLabel{"LABEL"};
inline constexpr Key<String> kLabelUnread{"LabelUnread"}; ///< labels that did not read, by a counter
inline constexpr Key<int> kNumMediumRolls{"NUM_MEDIUMROLLS"};
inline constexpr Key<String> kMediumRoll{"MEDIUMROLL"};
inline constexpr Key<String> kRollUnread{"RollUnread"}; ///< rolls that did not read, by a counter
inline constexpr Key<String> kReelId{"reelid"};
inline constexpr Key<double> kFilmSpeed{"TRANSFER_FILM_SPEED"};   ///< frames a second in the camera
inline constexpr Key<double> kFilmSyncFactor{"FILM_SYNC_FACTOR"}; ///< see `Qx::FilmSync`
inline constexpr Key<String> kShotVideo{"SHOT_VIDEO"};            ///< a `ShotVideoMetadata`
inline constexpr Key<String> kTrackOrigin{"TrackOrigin "};        ///< followed by a channel's stamp

/// The name of the header and the line that ends it in a text.
inline constexpr const char* kHeaderName = "EDIT";
inline constexpr const char* kHeaderEnd = "END_EDIT_HEADER";

/// Of a shot: the reel it is on.
inline constexpr const char* kReel = "REEL";

/// Names of objects in an edit's store.
inline constexpr const char* kCelid = "Celid";    ///< a cel, followed by a number
inline constexpr const char* kCues = "CueId";     ///< the cues
inline constexpr const char* kUnread = ".unread"; ///< ends the name of an object that was set aside

/// A name followed by a number.
[[nodiscard]] QM_API String numbered(std::string_view name, int number);
/// Removes every key that is `name` followed by a number of at least `from`.
QM_API void removeNumbered(configb& header, std::string_view name, int from);
/// True for a key, with its number if it has one, whose role is `Role::Bookkeeping`; the case of letters does
/// not count. A key of no row is content.
[[nodiscard]] QM_API bool isBookkeeping(std::string_view key);

} // namespace EditKeys
