#pragma once

#include <charconv>
#include <cstddef>
#include <functional>
#include <map>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace example {

/// Where frames are computed.
enum class Target {
    cpu,
    gl, ///< OpenGL, in a context without a window
};

/// A command line that asks for something that is not there; what() is one line for a person.
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// A whole number of 1 or more. Throws UsageError.
template <typename Number>
[[nodiscard]] Number positive(std::string const& option, std::string const& text) {
    Number value = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    bool const isWhole = end == text.data() + text.size() && text.find('-') == std::string::npos;
    if (isWhole && error == std::errc::result_out_of_range)
        throw UsageError(option + " is too large: " + text);
    if (!isWhole || error != std::errc() || value < 1)
        throw UsageError(option + " needs a whole number of 1 or more, not \"" + text + "\"");
    return value;
}

/// Reads a command line: options by their names, in any order, and files. "--name value" and "--name=value"
/// are the same. A lone "-" and all that stands behind "--" are files, whatever they look like.
class CommandLine {
public:
    using Take = std::function<void(std::string const& value)>;

    /// An option that has no value.
    void addFlag(std::string const& name, bool& flag);
    /// An option with a value, which is handed to `take`. That may throw UsageError.
    void addOption(std::string const& name, Take take);
    /// An option whose value is any text.
    void addText(std::string const& name, std::string& text);
    /// An option whose value is a whole number of 1 or more.
    template <typename Number>
    void addNumber(std::string const& name, Number& number) {
        addOption(name,
                  [name, &number](std::string const& value) { number = positive<Number>(name, value); });
    }

    /// Reads the arguments behind the name of the program and gives the files. Throws UsageError for unknown
    /// options, for values that are missing or that an option has not, and what the options' takers throw.
    [[nodiscard]] std::vector<std::string> read(int argc, char const* const* argv) const;

private:
    struct Option {
        bool* flag; ///< null for an option with a value
        Take take;
    };

    [[nodiscard]] Option const& named(std::string const& name) const;

    std::map<std::string, Option> options_;
};

/// What the programs have in common that run a filter over a picture file.
struct FilterOptions {
    std::string filter;
    std::vector<std::pair<std::string, std::string>> values; ///< of --set, in order
    Target target = Target::cpu;
    std::size_t threads = 0; ///< 0: as many as the machine has
    bool help = false;
    std::string input;
    std::string output;
};

/// Adds --filter, --set, --target, --threads and --help.
void addFilterOptions(CommandLine& commandLine, FilterOptions& options);

/// Takes the two files. `list` is what a user types to see the filters. Throws UsageError where a file or the
/// filter is missing.
void takeFiles(FilterOptions& options, std::vector<std::string> const& files, std::string const& list);

} // namespace example
