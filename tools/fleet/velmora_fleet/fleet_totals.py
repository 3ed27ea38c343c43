"""What a fleet adds up per configuration: the replayed sessions, their trace time and calls,
energy and saturated time per domain (from the summaries' "energy" object, when the sessions
have load lines), and the warnings about what was left applied, by kind."""


class FleetTotals:
    def __init__(self):
        self.sessions = 0
        self.trace_ms = 0.0
        self.calls = 0
        self.energy = {}  # domain id -> {"mJ": ..., "saturated_ms": ...}
        self.left_applied = 0
        self.left_applied_by_kind = {}

    def add(self, summary):
        """Adds one replay's --summary-json object."""
        self.sessions += 1
        self.trace_ms += summary.get("trace_ms", 0.0)
        self.calls += summary.get("calls", 0)
        for domain, figures in sorted(summary.get("energy", {}).items()):
            total = self.energy.setdefault(domain, {"mJ": 0.0, "saturated_ms": 0.0})
            total["mJ"] += figures.get("mJ", 0.0)
            total["saturated_ms"] += figures.get("saturated_ms", 0.0)
        for warning in summary.get("warnings", []):
            self.left_applied += 1
            kind = warning.get("kind", "")
            self.left_applied_by_kind[kind] = self.left_applied_by_kind.get(kind, 0) + 1

    def to_json(self):
        return {
            "sessions": self.sessions,
            "trace_ms": self.trace_ms,
            "calls": self.calls,
            "energy": {d: self.energy[d] for d in sorted(self.energy)},
            "left_applied": self.left_applied,
            "left_applied_by_kind": {k: self.left_applied_by_kind[k]
                                     for k in sorted(self.left_applied_by_kind)},
        }

    @staticmethod
    def of(results, side):
        """Totals of one side over the sessions that ran without failing."""
        totals = FleetTotals()
        for result in results:
            if result["status"] == "ok" and result.get(side) is not None:
                totals.add(result[side])
        return totals.to_json()
