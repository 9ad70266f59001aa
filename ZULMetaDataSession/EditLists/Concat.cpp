// Lists for the concat demuxer of ffmpeg: a directive in each line.
//
//     ffconcat version 1.0
//     file 'My recording.mp4'
//     inpoint 10
//     outpoint 0:20.5

#include "ZULMetaDataSession/EditLists/Formats.h"
#include "ZULMetaDataSession/EditLists/ListBuilder.h"

#include <algorithm>
#include <array>

namespace ZULMetaData::detail {

namespace {

constexpr std::string_view s_concatBlanks = " \t\r\n";

/// What a list says of one file.
struct ConcatFile {
    std::size_t line = 0;
    std::optional<Rational> inPoint;
    std::optional<Rational> outPoint;
    std::optional<Rational> duration;
};

/// Directives that change neither which file is read nor which part of it.
constexpr std::array s_otherDirectives{"file_packet_metadata", "file_packet_meta", "stream",
                                       "exact_stream_id",      "stream_meta",      "stream_codec",
                                       "stream_extradata",     "chapter"};

/// Reads the directives of one list.
class ConcatReader {
public:
    ConcatReader(const std::string& file, const EditListOptions& options) : list_(file), options_(options) {}

    EditList read(std::string_view text) {
        for (std::size_t line = 1; !text.empty(); ++line) {
            line_ = line;
            list_.moveTo("line", line);
            readDirective(takeLine(text));
        }
        addFile();
        return list_.take();
    }

private:
    void readDirective(std::string_view line) {
        rest_ = trimmed(line);
        if (rest_.empty() || rest_.front() == '#')
            return;
        const std::string_view directive = takeWord();
        if (directive == "ffconcat")
            readVersion();
        else if (directive == "file")
            beginFile();
        else if (directive == "inpoint")
            readTime(directive, &ConcatFile::inPoint);
        else if (directive == "outpoint")
            readTime(directive, &ConcatFile::outPoint);
        else if (directive == "duration")
            readTime(directive, &ConcatFile::duration);
        else if (std::find(s_otherDirectives.begin(), s_otherDirectives.end(), directive) == s_otherDirectives.end())
            list_.fail(inQuotes(directive) + " is no directive that an edit list can follow");
    }

    std::string_view takeWord() {
        const std::size_t end = std::min(rest_.find_first_of(s_concatBlanks), rest_.size());
        const std::string_view word = rest_.substr(0, end);
        rest_ = trimmed(rest_.substr(end));
        return word;
    }

    void requireEnd() const {
        if (!rest_.empty() && rest_.front() != '#')
            list_.fail("something follows: " + inQuotes(rest_));
    }

    void readVersion() {
        if (takeWord() != "version" || takeWord() != "1.0")
            list_.fail("the list is not of version 1.0");
        requireEnd();
    }

    void beginFile() {
        addFile();
        list_.moveTo("line", line_);
        const std::string name = takeName();
        if (name.empty())
            list_.fail("the name of the file is missing");
        requireEnd();
        list_.requireSource(name);
        current_ = ConcatFile();
        current_->line = line_;
    }

    /// A backslash takes the next character for itself; between single quotes every character stands for itself.
    std::string takeName() {
        std::string name;
        while (!rest_.empty() && s_concatBlanks.find(rest_.front()) == std::string_view::npos) {
            const char c = rest_.front();
            rest_.remove_prefix(1);
            if (c == '\\' && !rest_.empty()) {
                name += rest_.front();
                rest_.remove_prefix(1);
            } else if (c == '\'') {
                const std::size_t end = rest_.find('\'');
                if (end == std::string_view::npos)
                    list_.fail("a quotation mark has no second one");
                name += rest_.substr(0, end);
                rest_.remove_prefix(end + 1);
            } else {
                name += c;
            }
        }
        rest_ = trimmed(rest_);
        return name;
    }

    void readTime(std::string_view directive, std::optional<Rational> ConcatFile::*member) {
        if (!current_)
            list_.fail("it stands before the first file");
        if ((*current_).*member)
            list_.fail("a second " + std::string(directive) + " of one file");
        const std::string_view text = takeWord();
        const auto time = timeOf(text);
        if (!time)
            list_.fail(inQuotes(text) + " is no time such as 12.5, 1:30.5 or 500ms");
        requireEnd();
        (*current_).*member = time;
    }

    static std::optional<Rational> timeOf(std::string_view text) {
        Rational unit = 1;
        for (const auto& [suffix, perSecond] : {std::pair("ms", 1000), std::pair("us", 1000000), std::pair("s", 1)})
            if (text.ends_with(suffix) && text.find(':') == std::string_view::npos) {
                text.remove_suffix(std::string_view(suffix).size());
                unit = Rational(1, perSecond);
                break;
            }
        if (text.find('/') != std::string_view::npos)
            return std::nullopt;
        if (text.ends_with('.') && text.size() > 1)
            text.remove_suffix(1);
        const auto time = parseEditTime(text);
        return time ? std::optional(*time * unit) : std::nullopt;
    }

    /// A file is played from its in point to its out point; the duration is the length of that.
    void addFile() {
        if (!current_)
            return;
        list_.moveTo("line", current_->line);
        const Rational start = current_->inPoint.value_or(0);
        if (current_->outPoint && current_->duration && *current_->outPoint != start + *current_->duration)
            list_.fail("the duration is not the time from the in point to the out point, so the last frame stays or "
                       "files overlap, which an edit list cannot say");
        if (current_->outPoint)
            list_.keep(start, *current_->outPoint);
        else if (current_->duration)
            list_.keep(start, start + *current_->duration);
        else if (options_.duration)
            list_.keep(start, *options_.duration);
        else
            list_.fail("the file is played to its end, and the duration of the recording is not known");
        current_.reset();
    }

    ListBuilder list_;
    const EditListOptions& options_;
    std::size_t line_ = 0;
    std::string_view rest_; ///< of the line
    std::optional<ConcatFile> current_;
};

} // namespace

EditList readConcat(std::string_view text, const std::string& file, const EditListOptions& options) {
    return ConcatReader(file, options).read(text);
}

bool beginsConcat(std::string_view line) {
    const std::vector<std::string_view> words = wordsOf(line);
    return words.size() >= 2 && (words[0] == "file" || (words[0] == "ffconcat" && words[1] == "version"));
}

} // namespace ZULMetaData::detail
