// orvek-sim: a demo plant on the local data server, and a load generator.
//
// The plant has three processes: "boiler" (drum level, pressure and
// temperature, burner, status bits, writable set points, level and pressure
// alarms), "tanks" (levels, valves, product name, operator note, a vector of
// levels, a dictionary of tank data, the last sample time) and "packaging"
// (counters, line speed, label bytes, jam alarms). Values follow smooth
// random walks at their own rates; now and then a sensor fails for a few
// seconds, which shows in the quality word.
//
// With --load N --rate R it instead runs one process "load" with N numeric
// variables and publishes R changes per second in total, evenly paced.

#include "fen/osdep/Daemon.h"
#include "network/protocol/Catalogue.h"
#include "network/protocol/WriteResult.h"
#include "network/publisher/Publisher.h"
#include "value/TypeCodes.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <memory>
#include <mutex>
#include <optional>
#include <random>
#include <string>
#include <vector>

namespace {

using namespace qv;
using network::publisher::Publisher;
using network::publisher::PublisherOptions;
using network::publisher::WriteDecision;
using network::publisher::WriteRequestInfo;
using value::NumericKind;
using value::VarData;
namespace TypeCode = value::TypeCode;
namespace Access = network::protocol::Access;
namespace WriteStatus = network::protocol::WriteStatus;
using Clock = std::chrono::steady_clock;

constexpr std::uint32_t kRead = Access::Read;
constexpr std::uint32_t kReadWrite = Access::Read | Access::Write;
constexpr std::uint64_t kSensorFailure = 0x2;

struct Options {
    PublisherOptions connection;
    std::optional<double> seconds;
    std::uint32_t load = 0;
    double rate = 0.0;
    bool ensureServices = false;
};

void Usage(FILE* out)
{
    std::fprintf(out,
                 "usage: orvek-sim [--host H] [--port P] [--user U] [--password W] [--seconds N]\n"
                 "                 [--load N --rate R] [--qos 0|1] [--ensure-services]\n"
                 "Publishes a demo plant (processes boiler, tanks and packaging) on the data\n"
                 "server, or with --load one process \"load\" with N numeric variables changing\n"
                 "R times per second in total. Runs until SIGINT or SIGTERM, or N seconds.\n");
}

bool ParseNumber(const char* text, double least, double most, double& number)
{
    char* end = nullptr;
    errno = 0;
    number = std::strtod(text, &end);
    return errno == 0 && end != text && *end == '\0' && std::isfinite(number) && number >= least && number <= most;
}

/// Reads the command line; false (after a message) when it is not usable.
bool ParseOptions(int argc, char** argv, Options& options)
{
    for (int i = 1; i < argc; ++i) {
        const std::string name = argv[i];
        if (name == "--help" || name == "-h") {
            Usage(stdout);
            std::exit(0);
        }
        if (name == "--ensure-services") {
            options.ensureServices = true;
            continue;
        }
        static const char* const kWithValue[] = {"--host", "--port", "--user", "--password",
                                                 "--seconds", "--load", "--rate", "--qos"};
        if (std::none_of(std::begin(kWithValue), std::end(kWithValue), [&](const char* known) { return name == known; })) {
            std::fprintf(stderr, "orvek-sim: unknown option %s\n", name.c_str());
            return false;
        }
        if (i + 1 >= argc) {
            std::fprintf(stderr, "orvek-sim: %s needs a value\n", name.c_str());
            return false;
        }
        const char* text = argv[++i];
        double number = 0.0;
        auto numberIn = [&](double least, double most) {
            if (ParseNumber(text, least, most, number))
                return true;
            std::fprintf(stderr, "orvek-sim: %s: \"%s\" is not a number from %g to %g\n", name.c_str(), text, least,
                         most);
            return false;
        };
        if (name == "--host") {
            options.connection.host = text;
        } else if (name == "--user") {
            options.connection.user = text;
        } else if (name == "--password") {
            options.connection.password = text;
        } else if (name == "--port") {
            if (!numberIn(1, 65535) || number != std::floor(number))
                return false;
            options.connection.port = static_cast<std::uint16_t>(number);
        } else if (name == "--seconds") {
            if (!numberIn(0, 1e9))
                return false;
            options.seconds = number;
        } else if (name == "--load") {
            if (!numberIn(1, 1000000) || number != std::floor(number))
                return false;
            options.load = static_cast<std::uint32_t>(number);
        } else if (name == "--rate") {
            if (!numberIn(0.001, 10000000))
                return false;
            options.rate = number;
        } else if (name == "--qos") {
            if (!numberIn(0, 1) || number != std::floor(number))
                return false;
            options.connection.valueQos = static_cast<int>(number);
        }
    }
    if ((options.load != 0) != (options.rate != 0.0)) {
        std::fprintf(stderr, "orvek-sim: --load and --rate go together\n");
        return false;
    }
    return true;
}

/// A value that drifts smoothly toward a target with random noise
/// (a mean-reverting random walk), kept within its limits.
class Drift {
public:
    Drift(double start, double least, double most, double pull, double noise)
        : value_(start), target_(start), least_(least), most_(most), pull_(pull), noise_(noise)
    {
    }
    double Step(std::mt19937& random, double seconds)
    {
        std::normal_distribution<double> gauss(0.0, 1.0);
        value_ += pull_ * (target_ - value_) * seconds + noise_ * std::sqrt(seconds) * gauss(random);
        value_ = std::clamp(value_, least_, most_);
        return value_;
    }
    void SetTarget(double target) { target_ = target; }
    double Value() const { return value_; }

private:
    double value_;
    double target_;
    double least_;
    double most_;
    double pull_;
    double noise_;
};

/// Something to do every `period`.
struct Every {
    double period;
    double due = 0.0;
    bool Due(double now)
    {
        if (now < due)
            return false;
        due = now + period;
        return true;
    }
};

/// A simulated process: its publisher, its random source, the sensor
/// failures that come and go, and its own set of variables.
class Process {
public:
    Process(const std::string& name, const PublisherOptions& options, unsigned seed)
        : publisher_(name, options), random_(seed)
    {
    }
    virtual ~Process() = default;

    void Start() { publisher_.Start(); }
    void Stop() { publisher_.Stop(); }
    /// Moves the simulation on to `now` seconds after the start.
    virtual void Tick(double now, double step) = 0;
    std::uint64_t Published() const { return published_; }

protected:
    void Declare(const char* path, std::uint16_t type, NumericKind kind, std::uint32_t access)
    {
        publisher_.DeclareVariable(path, type, static_cast<std::uint8_t>(kind), access);
    }
    void Declare(const char* path, std::uint16_t type, std::uint32_t access = kRead)
    {
        publisher_.DeclareVariable(path, type, 0, access);
    }
    /// Publishes with the sensor-failure bit while `path` has a failed sensor.
    void Put(const char* path, const VarData& value)
    {
        publisher_.Publish(path, value, failedSensor_ == path ? kSensorFailure : 0);
        ++published_;
    }
    /// Now and then one of `sensors` fails for a few seconds.
    void FailSensors(double now, const std::vector<const char*>& sensors)
    {
        if (!failedSensor_.empty() && now >= failureEnds_) {
            failedSensor_.clear();
            nextFailure_ = now + std::uniform_real_distribution<double>(15.0, 40.0)(random_);
        } else if (failedSensor_.empty() && now >= nextFailure_) {
            failedSensor_ = sensors[std::uniform_int_distribution<std::size_t>(0, sensors.size() - 1)(random_)];
            failureEnds_ = now + std::uniform_real_distribution<double>(3.0, 6.0)(random_);
        }
    }
    bool Chance(double perSecond, double step)
    {
        return std::uniform_real_distribution<double>(0.0, 1.0)(random_) < perSecond * step;
    }

    Publisher publisher_;
    std::mt19937 random_;
    /// Set points and switches written from the network thread.
    std::mutex setPointMutex_;

private:
    std::uint64_t published_ = 0;
    std::string failedSensor_;
    double failureEnds_ = 0.0;
    double nextFailure_ = 8.0;
};

/// Accepts a number written to a set point when it lies within the limits.
WriteDecision WithinLimits(const VarData& value, double least, double most)
{
    const double number = value.ToDouble();
    if (number >= least && number <= most)
        return {};
    char text[96];
    std::snprintf(text, sizeof text, "the set point must lie from %g to %g", least, most);
    return {WriteStatus::BadValue, text};
}

class Boiler final : public Process {
public:
    Boiler(const PublisherOptions& options, unsigned seed) : Process("boiler", options, seed)
    {
        Declare("drum.level", TypeCode::Numeric, NumericKind::Float64, kRead);
        Declare("drum.pressure", TypeCode::Numeric, NumericKind::Float32, kRead);
        Declare("drum.temperature", TypeCode::Numeric, NumericKind::Int16, kRead);
        Declare("steam.flow", TypeCode::Numeric, NumericKind::UInt16, kRead);
        Declare("fuel.valve", TypeCode::Numeric, NumericKind::UInt8, kRead);
        Declare("burner.on", TypeCode::Logical);
        Declare("status", TypeCode::Numeric, NumericKind::BitField, kRead);
        Declare("drum.level.setpoint", TypeCode::Numeric, NumericKind::Float64, kReadWrite);
        Declare("drum.pressure.setpoint", TypeCode::Numeric, NumericKind::Float32, kReadWrite);
        Declare("burner.enable", TypeCode::Logical, kReadWrite);
        publisher_.DeclareAlarm("drum-level-high", "Drum level high", 700, "drum.level");
        publisher_.DeclareAlarm("pressure-high", "Drum pressure high", 900, "drum.pressure");

        publisher_.Publish("drum.level.setpoint", VarData::MakeNumeric(levelSetPoint_));
        publisher_.Publish("drum.pressure.setpoint", VarData::MakeNumeric(pressureSetPoint_));
        publisher_.Publish("burner.enable", VarData::MakeLogical(burnerEnabled_));
        publisher_.SetWriteHandler([this](const WriteRequestInfo& request, VarData& value) -> WriteDecision {
            std::lock_guard lock(setPointMutex_);
            if (request.path == "drum.level.setpoint") {
                const WriteDecision decision = WithinLimits(value, 20.0, 80.0);
                if (decision.status == WriteStatus::Written)
                    levelSetPoint_ = value.ToDouble();
                return decision;
            }
            if (request.path == "drum.pressure.setpoint") {
                const WriteDecision decision = WithinLimits(value, 5.0, 40.0);
                if (decision.status == WriteStatus::Written)
                    pressureSetPoint_ = value.ToDouble();
                return decision;
            }
            if (request.path == "burner.enable")
                burnerEnabled_ = value.ToBool();
            return {};
        });
    }

    void Tick(double now, double step) override
    {
        double levelTarget, pressureTarget;
        bool enabled;
        {
            std::lock_guard lock(setPointMutex_);
            levelTarget = levelSetPoint_;
            pressureTarget = pressureSetPoint_;
            enabled = burnerEnabled_;
        }
        FailSensors(now, {"drum.level", "drum.pressure", "drum.temperature", "steam.flow"});
        // Now and then a disturbance drives the level up for a while.
        if (now >= disturbanceEnds_ && Chance(1.0 / 40.0, step))
            disturbanceEnds_ = now + 10.0;
        level_.SetTarget(levelTarget + (now < disturbanceEnds_ ? 25.0 : 0.0));
        const double level = level_.Step(random_, step);
        // The burner holds the pressure between set point -1 and +1 bar.
        const double pressureNow = pressure_.Value();
        if (!enabled || pressureNow > pressureTarget + 1.0)
            burnerOn_ = false;
        else if (pressureNow < pressureTarget - 1.0)
            burnerOn_ = true;
        pressure_.SetTarget(burnerOn_ ? pressureTarget + 3.0 : pressureTarget - 3.0);
        const double pressure = pressure_.Step(random_, step);
        temperature_.SetTarget(100.0 + 8.0 * pressure);
        const double temperature = temperature_.Step(random_, step);
        const double flow = flow_.Step(random_, step);

        if (levelEvery_.Due(now))
            Put("drum.level", VarData::MakeNumeric(level));
        if (pressureEvery_.Due(now))
            Put("drum.pressure", VarData::MakeNumeric(pressure));
        if (temperatureEvery_.Due(now))
            Put("drum.temperature", VarData::MakeNumeric(std::round(temperature)));
        if (flowEvery_.Due(now))
            Put("steam.flow", VarData::MakeNumeric(std::round(flow)));
        if (slowEvery_.Due(now)) {
            Put("fuel.valve", VarData::MakeNumeric(burnerOn_ ? std::round(40.0 + flow / 100.0) : 0.0));
            Put("burner.on", VarData::MakeLogical(burnerOn_));
            const bool levelHigh = level > levelTarget + 15.0;
            const bool pressureHigh = pressure > pressureTarget + 4.0;
            std::uint32_t bits = 0;
            bits |= burnerOn_ ? 0x1u : 0u;
            bits |= enabled ? 0x2u : 0u;
            bits |= levelHigh ? 0x10u : 0u;
            bits |= level < levelTarget - 15.0 ? 0x20u : 0u;
            bits |= pressureHigh ? 0x40u : 0u;
            Put("status", VarData::MakeBitField(bits | 0x80000000u));
            Alarm("drum-level-high", "Drum level high", 700, "drum.level", levelHigh, levelAlarm_);
            Alarm("pressure-high", "Drum pressure high", 900, "drum.pressure", pressureHigh, pressureAlarm_);
        }
    }

private:
    void Alarm(const char* id, const char* text, std::uint16_t severity, const char* path, bool condition,
               bool& raised)
    {
        if (condition && !raised)
            publisher_.RaiseAlarm(id, text, severity, path);
        else if (!condition && raised)
            publisher_.ClearAlarm(id);
        raised = condition;
    }

    double levelSetPoint_ = 50.0;
    double pressureSetPoint_ = 16.0;
    bool burnerEnabled_ = true;
    bool burnerOn_ = true;
    bool levelAlarm_ = false;
    double disturbanceEnds_ = 0.0;
    bool pressureAlarm_ = false;
    Drift level_{50.0, 0.0, 100.0, 0.3, 2.0};
    Drift pressure_{16.0, 0.0, 45.0, 0.15, 0.4};
    Drift temperature_{228.0, 20.0, 500.0, 0.2, 1.0};
    Drift flow_{2400.0, 0.0, 6000.0, 0.05, 60.0};
    Every levelEvery_{0.2};
    Every pressureEvery_{0.5};
    Every temperatureEvery_{1.0};
    Every flowEvery_{0.25};
    Every slowEvery_{1.0};
};

class Tanks final : public Process {
public:
    Tanks(const PublisherOptions& options, unsigned seed) : Process("tanks", options, seed)
    {
        for (int i = 0; i < 3; ++i) {
            Declare(kLevels[i], TypeCode::Numeric, NumericKind::Float64, kRead);
            Declare(kValves[i], TypeCode::Logical, kReadWrite);
        }
        Declare("inlet.pressure", TypeCode::Numeric, NumericKind::Int8, kRead);
        Declare("pump.hours", TypeCode::Numeric, NumericKind::Int32, kRead);
        Declare("product.name", TypeCode::AnsiString, kReadWrite);
        Declare("operator.note", TypeCode::UnicodeString, kReadWrite);
        Declare("levels", TypeCode::Vector);
        Declare("tank.data", TypeCode::Dictionary);
        Declare("sample.time", TypeCode::SSTimeValue);
        publisher_.DeclareAlarm("tank1-overflow", "Tank 1 near overflow", 800, "tank1.level");

        for (int i = 0; i < 3; ++i)
            publisher_.Publish(kValves[i], VarData::MakeLogical(valves_[i]));
        publisher_.Publish("product.name", VarData("Heating oil EL"));
        publisher_.Publish("operator.note", VarData(u"Température stable \u2013 contrôle à 14h00 \u2713"));
        // Valves, product name and note take any write; the simulation reads
        // the valves back from their published values.
    }

    void Tick(double now, double step) override
    {
        FailSensors(now, {"tank1.level", "tank2.level", "tank3.level", "inlet.pressure"});
        // Tank 1 fills through its valve and empties into tank 2, and so on.
        for (int i = 0; i < 3; ++i)
            valves_[i] = publisher_.Value(kValves[i]).ToBool();
        const double flow = 0.4 * step;
        const double inflow = valves_[0] ? flow * 1.2 : 0.0;
        const double transfer1 = valves_[1] && levels_[0] > 0.0 ? flow : 0.0;
        const double transfer2 = valves_[2] && levels_[1] > 0.0 ? flow * 0.9 : 0.0;
        const double outflow = levels_[2] > 0.0 ? flow * 0.6 : 0.0;
        levels_[0] += inflow - transfer1;
        levels_[1] += transfer1 - transfer2;
        levels_[2] += transfer2 - outflow;
        for (double& level : levels_)
            level = std::clamp(level + std::normal_distribution<double>(0.0, 0.02)(random_), 0.0, 100.0);
        // The operator's inlet valve closes near the top and opens near the bottom.
        if (levels_[0] > 92.0 && valves_[0])
            publisher_.Publish(kValves[0], VarData::MakeLogical(false));
        else if (levels_[0] < 20.0 && !valves_[0])
            publisher_.Publish(kValves[0], VarData::MakeLogical(true));

        if (levelEvery_.Due(now))
            for (int i = 0; i < 3; ++i)
                Put(kLevels[i], VarData::MakeNumeric(levels_[i]));
        if (pressureEvery_.Due(now))
            Put("inlet.pressure", VarData::MakeNumeric(std::round(std::clamp(inlet_.Step(random_, 0.3), -20.0, 20.0))));
        if (vectorEvery_.Due(now)) {
            VarData levels;
            for (std::uint32_t i = 0; i < 3; ++i)
                levels.SetElement(i, VarData::MakeNumeric(std::round(levels_[i] * 10.0) / 10.0));
            Put("levels", levels);
            const bool overflow = levels_[0] > 90.0;
            if (overflow && !overflowAlarm_)
                publisher_.RaiseAlarm("tank1-overflow", "Tank 1 near overflow", 800, "tank1.level");
            else if (!overflow && overflowAlarm_)
                publisher_.ClearAlarm("tank1-overflow");
            overflowAlarm_ = overflow;
        }
        if (dataEvery_.Due(now)) {
            VarData data = VarData::NewDictionary();
            data[VarData("capacity.m3")] = VarData::MakeNumeric(250.0);
            data[VarData("product")] = publisher_.Value("product.name");
            data[VarData("tank1")] = VarData::MakeNumeric(std::round(levels_[0]));
            data[VarData("tank2")] = VarData::MakeNumeric(std::round(levels_[1]));
            data[VarData("tank3")] = VarData::MakeNumeric(std::round(levels_[2]));
            data[VarData("inlet.open")] = VarData::MakeLogical(valves_[0]);
            Put("tank.data", data);
            pumpHours_ += 1;
            Put("pump.hours", VarData::MakeNumeric(pumpHours_));
        }
        if (sampleEvery_.Due(now))
            Put("sample.time", VarData(network::publisher::CurrentTime()));
    }

private:
    static constexpr const char* kLevels[3] = {"tank1.level", "tank2.level", "tank3.level"};
    static constexpr const char* kValves[3] = {"tank1.valve", "tank2.valve", "tank3.valve"};
    double levels_[3] = {55.0, 40.0, 30.0};
    bool valves_[3] = {true, true, true};
    bool overflowAlarm_ = false;
    double pumpHours_ = 18230.0;
    Drift inlet_{2.0, -20.0, 20.0, 0.5, 2.0};
    Every levelEvery_{0.5};
    Every pressureEvery_{0.3};
    Every vectorEvery_{1.0};
    Every dataEvery_{2.0};
    Every sampleEvery_{5.0};
};

class Packaging final : public Process {
public:
    Packaging(const PublisherOptions& options, unsigned seed) : Process("packaging", options, seed)
    {
        Declare("count.total", TypeCode::UInt64);
        Declare("count.rejected", TypeCode::Numeric, NumericKind::UInt32, kRead);
        Declare("line.speed", TypeCode::Numeric, NumericKind::Float64, kRead);
        Declare("line.speed.setpoint", TypeCode::Numeric, NumericKind::UInt16, kReadWrite);
        Declare("line.running", TypeCode::Logical, kReadWrite);
        Declare("label.data", TypeCode::RawBytes);
        Declare("batch.id", TypeCode::AnsiString);
        publisher_.DeclareAlarm("jam", "Packaging line jammed", 800, "line.speed");

        publisher_.Publish("line.speed.setpoint", VarData::MakeNumeric(speedSetPoint_));
        publisher_.Publish("line.running", VarData::MakeLogical(true));
        publisher_.Publish("batch.id", VarData("B-2024-0001"));
        publisher_.SetWriteHandler([this](const WriteRequestInfo& request, VarData& value) -> WriteDecision {
            std::lock_guard lock(setPointMutex_);
            if (request.path == "line.speed.setpoint") {
                const WriteDecision decision = WithinLimits(value, 0.0, 600.0);
                if (decision.status == WriteStatus::Written)
                    speedSetPoint_ = value.ToDouble();
                return decision;
            }
            return {};
        });
    }

    void Tick(double now, double step) override
    {
        double setPoint;
        {
            std::lock_guard lock(setPointMutex_);
            setPoint = speedSetPoint_;
        }
        const bool running = publisher_.Value("line.running").ToBool();
        FailSensors(now, {"line.speed", "count.rejected"});
        if (jammed_ && now >= jamEnds_) {
            jammed_ = false;
            publisher_.ClearAlarm("jam");
        } else if (!jammed_ && running && Chance(1.0 / 45.0, step)) {
            jammed_ = true;
            jamEnds_ = now + std::uniform_real_distribution<double>(3.0, 8.0)(random_);
            publisher_.RaiseAlarm("jam", "Packaging line jammed", 800, "line.speed");
        }
        speed_.SetTarget(running && !jammed_ ? setPoint : 0.0);
        const double speed = speed_.Step(random_, step);
        packs_ += speed / 60.0 * step;
        while (packs_ >= 1.0) {
            packs_ -= 1.0;
            ++total_;
            if (Chance(0.02, 1.0))
                ++rejected_;
        }
        if (speedEvery_.Due(now))
            Put("line.speed", VarData::MakeNumeric(std::round(speed * 10.0) / 10.0));
        if (countEvery_.Due(now)) {
            Put("count.total", VarData::MakeUInt64(total_));
            Put("count.rejected", VarData::MakeNumeric(static_cast<double>(rejected_)));
        }
        if (labelEvery_.Due(now)) {
            char label[64];
            const int length = std::snprintf(label, sizeof label, "\x02LBL|%s|%012llu\x03", "B-2024-0001",
                                             static_cast<unsigned long long>(total_));
            std::vector<std::uint8_t> bytes(label, label + length);
            bytes.push_back(static_cast<std::uint8_t>(total_ & 0xFF)); // check byte, any value
            Put("label.data", VarData(bytes.data(), static_cast<std::uint32_t>(bytes.size())));
        }
    }

private:
    double speedSetPoint_ = 240.0;
    bool jammed_ = false;
    double jamEnds_ = 0.0;
    double packs_ = 0.0;
    std::uint64_t total_ = 9007199254740000ull; // beyond what a double counts exactly
    std::uint64_t rejected_ = 0;
    Drift speed_{240.0, 0.0, 650.0, 0.8, 3.0};
    Every speedEvery_{0.2};
    Every countEvery_{0.5};
    Every labelEvery_{3.0};
};

/// The load generator: N variables, R changes per second in total, paced
/// evenly; when it falls behind it catches up in one go.
class Load final : public Process {
public:
    Load(const PublisherOptions& options, unsigned seed, std::uint32_t count, double rate)
        : Process("load", options, seed), rate_(rate)
    {
        char path[32];
        for (std::uint32_t i = 0; i < count; ++i) {
            std::snprintf(path, sizeof path, "v%06u", i);
            paths_.emplace_back(path);
            publisher_.DeclareVariable(path, TypeCode::Numeric, 0, kRead);
            publisher_.Publish(path, VarData::MakeNumeric(0.0));
        }
        values_.assign(count, 0.0);
    }

    void Tick(double now, double) override
    {
        const auto due = static_cast<std::uint64_t>(now * rate_);
        std::normal_distribution<double> gauss(0.0, 1.0);
        for (; changes_ < due; ++changes_) {
            const std::size_t index = changes_ % paths_.size();
            values_[index] += gauss(random_);
            Put(paths_[index].c_str(), VarData::MakeNumeric(values_[index]));
        }
    }

    /// Seconds until the next change is due.
    double UntilNext(double now) const { return std::max(0.0, static_cast<double>(changes_ + 1) / rate_ - now); }

private:
    double rate_;
    std::uint64_t changes_ = 0;
    std::vector<std::string> paths_;
    std::vector<double> values_;
};

/// Waits up to `seconds` for SIGINT or SIGTERM; true when one came.
bool StopRequested(const sigset_t& stops, double seconds)
{
    const double clamped = std::clamp(seconds, 0.0, 1.0);
    timespec wait{static_cast<time_t>(clamped), static_cast<long>((clamped - std::floor(clamped)) * 1e9)};
    for (;;) {
        const int signal = ::sigtimedwait(&stops, nullptr, &wait);
        if (signal == SIGINT || signal == SIGTERM)
            return true;
        if (signal < 0 && errno == EINTR)
            continue;
        return false;
    }
}

int Run(const Options& options)
{
    // The stop signals are taken by sigtimedwait; blocking them here, before
    // any network thread exists, keeps them away from those threads.
    sigset_t stops;
    sigemptyset(&stops);
    sigaddset(&stops, SIGINT);
    sigaddset(&stops, SIGTERM);
    ::pthread_sigmask(SIG_BLOCK, &stops, nullptr);

    if (options.ensureServices)
        fen::osdep::EnsureRequiredDaemons();

    const unsigned seed = static_cast<unsigned>(Clock::now().time_since_epoch().count());
    std::vector<std::unique_ptr<Process>> processes;
    Load* load = nullptr;
    if (options.load != 0) {
        auto generator = std::make_unique<Load>(options.connection, seed, options.load, options.rate);
        load = generator.get();
        processes.push_back(std::move(generator));
    } else {
        processes.push_back(std::make_unique<Boiler>(options.connection, seed));
        processes.push_back(std::make_unique<Tanks>(options.connection, seed + 1));
        processes.push_back(std::make_unique<Packaging>(options.connection, seed + 2));
    }
    for (auto& process : processes)
        process->Start();
    std::fprintf(stderr, "orvek-sim: running\n");

    const Clock::time_point start = Clock::now();
    double last = 0.0;
    for (;;) {
        const double now = std::chrono::duration<double>(Clock::now() - start).count();
        if (options.seconds && now >= *options.seconds)
            break;
        for (auto& process : processes)
            process->Tick(now, std::max(now - last, 1e-6));
        last = now;
        double wait = load != nullptr ? load->UntilNext(now) : 0.05;
        if (options.seconds)
            wait = std::min(wait, *options.seconds - now);
        if (StopRequested(stops, wait))
            break;
    }

    std::uint64_t published = 0;
    for (auto& process : processes) {
        process->Stop();
        published += process->Published();
    }
    std::printf("orvek-sim: %llu value messages published\n", static_cast<unsigned long long>(published));
    return 0;
}

} // namespace

int main(int argc, char** argv)
{
    Options options;
    if (!ParseOptions(argc, argv, options)) {
        Usage(stderr);
        return 2;
    }
    try {
        return Run(options);
    } catch (const std::exception& e) {
        std::fprintf(stderr, "orvek-sim: %s\n", e.what());
        return 1;
    }
}
