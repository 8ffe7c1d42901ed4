/// CMPIResult of the broker: takes a copy of what a provider returns, and looks that it is what was asked for.
#pragma once

#include "host/objects/Object.h"

#include <string>
#include <vector>

namespace host {

struct Manner;
struct Answer;
struct Result_Sink;

class Result_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::result;
    static CMPIResultFT table(const Manner& manner);

    /// What the operation lets a provider return.
    enum class Takes { instances, paths, data, nothing };

    /// Results go to `answer`, or to `sink` if there is one; both outlive the object. `class_name`: results have to be
    /// of it ("" for any).
    Result_Object(Broker& owner, Origin from, Answer& answer, const Result_Sink* sink, Takes takes,
                  std::string class_name);
    std::string to_text() const override;

    CMPIStatus take(const CMPIInstance* instance);
    CMPIStatus take(const CMPIObjectPath* path);
    CMPIStatus take(const CMPIValue* value, CMPIType type);
    CMPIStatus take(const CMPIError* error);
    CMPIStatus finish();

    CMPIResult face;

private:
    bool open(const char* call, Takes takes);
    void check_path(const char* call, const Path& path);

    Answer& m_answer;
    const Result_Sink* const m_sink;
    const Takes m_takes;
    const std::string m_class;
    bool m_done = false;
};

} // namespace host
