// The texts of object paths: the host's, with and without a schema, and the runtime's of the module's own classes.
#include <cstdio>

#include "classes/repository.h"
#include "fuzz/fuzzing.h"
#include "host/PathText.h"
#include "host/Schema.h"
#include "runtime/Instance.h"

using fuzzing::expect;

static const host::Schema& schema()
{
    static const std::shared_ptr<const host::Schema> made = [] {
        std::string error;
        auto read =
            host::Schema::from_text("class T_Base { [Key] string Name; };\n"
                                    "class T_Numbers : T_Base { [Key] boolean B; [Key] uint8 U8; [Key] sint8 S8; [Key] "
                                    "uint64 U64; [Key] sint64 "
                                    "S64; [Key] datetime When; string Other; };\n"
                                    "[Association] class T_Link { [Key] T_Base REF From; [Key] T_Link REF To; };\n",
                                    error);
        expect(bool(read), "the schema of this program is read");
        return read;
    }();
    return *made;
}

static void expect_round_trip(const std::string& text, const host::Schema* known)
{
    const host::Path_Parse read = host::parse_path(text, known, "root/test");
    expect(read.ok == read.error.empty(), "a path or an error");
    if (!read.ok) return;
    const std::string written = host::path_to_text(read.path);
    if (written.size() > 64 * 1024) return; // longer than what is read at all
    const host::Path_Parse again = host::parse_path(written, known, "root/test");
    expect(again.ok, "a path that was written is read");
    expect(host::path_to_text(again.path) == written, "a path that was written reads as itself");
}

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    schema();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    expect_round_trip(text, nullptr);
    expect_round_trip(text, &schema());

    const cimple::Meta_Class* start = cimple::find_meta_class(&cimple::the_repository, "NVRHBA_FCPort");
    const cimple::Ref<cimple::Instance> made(cimple::model_path_to_instance(start, text.c_str()));
    if (!made) return 0;
    cimple::String written;
    if (cimple::instance_to_model_path(made.get(), written) != 0) return 0;
    static std::FILE* const nowhere = std::fopen("/dev/null", "w");
    cimple::print(nowhere, made.get(), true);
    return 0;
}
